#include "lib/base/KXNotificationCenter.h"

#include <memory>
#include <string>
#include <utility>
#include <vector>

KXNotificationCenter& KXNotificationCenter::defaultCenter() {
    static KXNotificationCenter center;
    return center;
}

void KXNotificationCenter::addObserver(const void* owner, std::string name, const void* object,
                                       Handler handler) {
    m_entries.push_back(std::make_shared<Entry>(Entry{owner, std::move(name), object, std::move(handler)}));
}

void KXNotificationCenter::removeObserver(const void* owner) {
    std::erase_if(m_entries, [owner](const auto& entry) {
        if (entry->owner != owner) return false;
        entry->removed = true;
        return true;
    });
}

void KXNotificationCenter::postNotification(const std::string& name, const void* object) {
    const KXNotification notification{name, object, {}};
    const auto snapshot = m_entries;
    for (const auto& entry : snapshot) {
        const bool concerned = entry->name == name && (!entry->object || entry->object == object);
        if (concerned && !entry->removed) entry->handler(notification);
    }
}
