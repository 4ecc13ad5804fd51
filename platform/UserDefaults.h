#pragma once

#include <string>

namespace platform {

/// The user's settings, read only.
class UserDefaults {
public:
    virtual ~UserDefaults() = default;
    /// Of the global domain; 0 when absent or no number.
    virtual int integerForKey(const std::string& key) const = 0;
};

} // namespace platform
