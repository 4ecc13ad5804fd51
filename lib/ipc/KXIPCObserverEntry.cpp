#include "lib/ipc/KXIPCObserverEntry.h"

#include "lib/base/IsEqual.h"
#include "lib/base/KXNotificationCenter.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/plist/Value.h"

#include <any>
#include <cstddef>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

const plist::Value& KXUserInfo(const KXNotification& notification) {
    static const plist::Value nothing;
    const auto* userInfo = std::any_cast<plist::Value>(&notification.userInfo);
    return userInfo ? *userInfo : nothing;
}

KXIPCObserverEntry::KXIPCObserverEntry(std::optional<std::string> name, std::optional<std::string> object,
                                       Selector selector)
    : m_name(std::move(name))
    , m_object(std::move(object))
    , m_selector(std::move(selector)) {}

plist::Value KXIPCObserverEntry::propertyList() const {
    plist::Dictionary list;
    // An object without a name looks worth sending; the list ends at the first value that is missing.
    if (!m_name) return list;
    list.set("name", *m_name);
    if (m_object) list.set("object", *m_object);
    return list;
}

std::vector<std::size_t> KXIPCObserverEntry::matchesInObserverArray(const Array& entries) const {
    std::vector<std::size_t> matches;
    for (std::size_t index = 0; index < entries.size(); ++index) {
        const auto& entry = *entries[index];
        // The other entry's missing object looks like a wildcard, as for a message; here it is ours that is.
        const bool objectMatches = !m_object || KXIsEqual(m_object, entry.object());
        if (KXIsEqual(m_name, entry.name()) && objectMatches) matches.push_back(index);
    }
    return matches;
}

std::optional<KXIPCObserverEntry::Array>
KXIPCObserverEntry::observerEntryTableFromNotification(const KXNotification& notification) {
    const auto table = KXUserInfo(notification)[KX_IPC_PARAM_MSG_TABLE];
    if (!table.isArray()) return std::nullopt;
    Array entries;
    entries.reserve(table.size());
    for (const auto& row : table)
        entries.push_back(
            std::make_shared<KXIPCObserverEntry>(row["name"].string(), row["object"].string(), nullptr));
    return entries;
}

KXIPCObserverEntry::Array KXIPCObserverEntryArray(const KXIPCObserverEntryRow* table, std::size_t count) {
    KXIPCObserverEntry::Array entries;
    entries.reserve(count);
    for (std::size_t index = 0; index < count; ++index) {
        const auto& row = table[index];
        entries.push_back(std::make_shared<KXIPCObserverEntry>(row.name, row.object, row.selector));
    }
    return entries;
}
