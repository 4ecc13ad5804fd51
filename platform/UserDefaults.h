#pragma once

#include <string_view>

namespace platform {

/// The user's settings, read only.
class UserDefaults {
public:
    virtual ~UserDefaults() = default;
    /// Of the global domain; 0 when absent or no number.
    virtual int integerForKey(std::string_view key) const = 0;
};

} // namespace platform
