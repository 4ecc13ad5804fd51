#pragma once

#include "lib/plist/Value.h"

#include <optional>
#include <string>
#include <string_view>
#include <utility>

/// The properties record that a program is launched with: a dictionary. It travels in one variable of the
/// environment as a base64 binary property list.
class KXAppleEvent {
public:
    static constexpr const char* variable = "KX_LAUNCH_PROPERTIES";

    explicit KXAppleEvent(plist::Dictionary properties)
        : m_properties(std::move(properties)) {}

    const plist::Value& properties() const { return m_properties; }

    /// The variable's value; a status code, and `record` as it was, when the properties hold a nil or are
    /// larger than a variable may be.
    int copyIntoEventRecord(std::string& record) const;

    /// What such a value holds; nothing for any other text.
    static std::optional<KXAppleEvent> ofEventRecord(std::string_view record);
    /// What this process was launched with.
    static std::optional<KXAppleEvent> ofThisLaunch();

private:
    explicit KXAppleEvent(plist::Value properties)
        : m_properties(std::move(properties)) {}

    plist::Value m_properties;
};
