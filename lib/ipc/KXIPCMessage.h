#pragma once

#include "lib/ipc/KXIPCObserverEntry.h"
#include "lib/plist/Value.h"

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

/// One message: its name, an optional qualifier, and what it carries. Immutable; any thread may read it. One
/// that has arrived shares the bytes it came in, and keeps them as long as any value of it is kept.
class KXIPCMessage {
public:
    KXIPCMessage(std::optional<std::string> name, std::optional<std::string> object, plist::Value userInfo);
    /// From a message property list. Values of the wrong type count as absent.
    static KXIPCMessage initWithInfo(const plist::Value& info);

    const std::optional<std::string>& name() const { return m_name; }
    const std::optional<std::string>& object() const { return m_object; }
    const plist::Value& userInfo() const { return m_userInfo; } ///< a dictionary or nil

    plist::Value propertyList() const;
    /// Same name, and the entry's object absent or equal to the message's.
    bool matches(const KXIPCObserverEntry& entry) const;
    /// Indexes, ascending, of the entries that this message matches.
    std::vector<std::size_t> matchesInObserverArray(const KXIPCObserverEntry::Array& entries) const;
    std::string description() const;

private:
    std::optional<std::string> m_name;
    std::optional<std::string> m_object;
    plist::Value m_userInfo;
};
