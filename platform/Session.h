#pragma once

#include <optional>

namespace platform {

/// The login session that this process belongs to. Main thread only.
class Session {
public:
    virtual ~Session() = default;

    /// Whether it is the one that is on the screen; nothing when there is no session, or nobody tells.
    virtual std::optional<bool> isActive() const = 0;
};

} // namespace platform
