#pragma once

#include "lib/base/KXNotificationCenter.h"
#include "lib/plist/Value.h"

#include <cstddef>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

/// What an observer of messages gets: `object` holds a std::string, if there is one, `userInfo` a
/// plist::Value.
const plist::Value& KXUserInfo(const KXNotification& notification);

/// One row of an observer's table: which messages, and what to call. Immutable; compared by identity alone.
/// The selector is called on the main thread, and lives as long as the entry: until it is removed and no
/// dispatch is under way.
class KXIPCObserverEntry {
public:
    using Selector = std::function<void(const KXNotification&)>;
    using Pointer = std::shared_ptr<const KXIPCObserverEntry>;
    using Array = std::vector<Pointer>;

    KXIPCObserverEntry(std::optional<std::string> name, std::optional<std::string> object, Selector selector);
    ~KXIPCObserverEntry() = default;
    KXIPCObserverEntry(const KXIPCObserverEntry&) = delete;
    KXIPCObserverEntry& operator=(const KXIPCObserverEntry&) = delete;

    const std::optional<std::string>& name() const { return m_name; }
    const std::optional<std::string>& object() const { return m_object; }
    const Selector& selector() const { return m_selector; }

    plist::Value propertyList() const;
    /// Indexes, ascending, of the entries that this one stands for: same name, and this entry's object absent
    /// or equal to theirs. The wildcard is on the other side than in a message's matching.
    std::vector<std::size_t> matchesInObserverArray(const Array& entries) const;

    /// Entries without selectors from the table in an add or remove message; nothing when it holds no table.
    static std::optional<Array> observerEntryTableFromNotification(const KXNotification& notification);

private:
    std::optional<std::string> m_name;
    std::optional<std::string> m_object;
    Selector m_selector;
};

struct KXIPCObserverEntryRow {
    const char* name;
    KXIPCObserverEntry::Selector selector;
    std::optional<std::string> object;
};

/// Entries made from a table, in its order.
KXIPCObserverEntry::Array KXIPCObserverEntryArray(const KXIPCObserverEntryRow* table, std::size_t count);
