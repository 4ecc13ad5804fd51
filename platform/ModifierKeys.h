#pragma once

namespace platform {

/// The keyboard's modifiers as they are held at this moment.
class ModifierKeys {
public:
    virtual ~ModifierKeys() = default;
    /// Alt; not AltGr.
    virtual bool isOptionDown() const = 0;
};

} // namespace platform
