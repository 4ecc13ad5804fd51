#pragma once

#include "lib/plist/Value.h"
#include "platform/UserDefaults.h"

#include <cstdint>
#include <filesystem>
#include <string>
#include <string_view>

namespace platform {

/// Settings from a property-list file, read again when the file has changed. A file that cannot be parsed is
/// logged once and holds nothing until it changes. Main thread only.
class PlistUserDefaults final : public UserDefaults {
public:
    /// Of the domain: ~/Library/Preferences/<domain>.plist.
    explicit PlistUserDefaults(const std::string& domain = ".GlobalPreferences");

    int integerForKey(std::string_view key) const override;
    bool holds(std::string_view key) const;

private:
    const plist::Value& values() const;
    /// Of the file as it was read; all zero while there is none.
    struct Stamp {
        std::filesystem::file_time_type modified;
        std::uintmax_t size = 0;
        friend bool operator==(const Stamp&, const Stamp&) = default;
    };
    Stamp currentStamp() const;
    plist::Value read() const;

    std::filesystem::path m_path;
    mutable Stamp m_stamp;
    mutable plist::Value m_values;
};

} // namespace platform
