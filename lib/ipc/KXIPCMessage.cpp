#include "lib/ipc/KXIPCMessage.h"

#include "lib/base/IsEqual.h"
#include "lib/ipc/KXIPCObserverEntry.h"
#include "lib/plist/Value.h"

#include <cstddef>
#include <optional>
#include <string>
#include <utility>
#include <vector>

KXIPCMessage::KXIPCMessage(std::optional<std::string> name, std::optional<std::string> object,
                           plist::Value userInfo)
    : m_name(std::move(name))
    , m_object(std::move(object))
    , m_userInfo(userInfo.isDictionary() ? std::move(userInfo) : plist::Value()) {}

KXIPCMessage KXIPCMessage::initWithInfo(const plist::Value& info) {
    return {info["name"].string(), info["object"].string(), info["userInfo"]};
}

plist::Value KXIPCMessage::propertyList() const {
    const auto text = [](const std::optional<std::string>& string) {
        return string ? plist::Value(*string) : plist::Value();
    };
    return plist::Dictionary{{"name", text(m_name)}, {"object", text(m_object)}, {"userInfo", m_userInfo}};
}

bool KXIPCMessage::matches(const KXIPCObserverEntry& entry) const {
    return KXIsEqual(m_name, entry.name()) && (!entry.object() || KXIsEqual(entry.object(), m_object));
}

std::vector<std::size_t>
KXIPCMessage::matchesInObserverArray(const KXIPCObserverEntry::Array& entries) const {
    std::vector<std::size_t> indexes;
    for (std::size_t index = 0; index < entries.size(); ++index)
        if (matches(*entries[index])) indexes.push_back(index);
    return indexes;
}

std::string KXIPCMessage::description() const {
    std::string text = "\t\t name: " + m_name.value_or("(null)") + "\n";
    // A separator between lines that end in one looks wrong; the blank lines are how this has always read.
    text += "\n\t\t object: " + m_object.value_or("(null)") + "\n";
    for (std::size_t index = 0; index < m_userInfo.size(); ++index)
        text += "\n\t\t info." + m_userInfo.keyAt(index) + ": " + m_userInfo.at(index).description() + "\n";
    return text;
}
