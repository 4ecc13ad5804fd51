#pragma once

#include "platform/MainLoop.h"

#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace platform {

/// The observers of notices in one process. Main thread only. A handle may outlive the list, and may be
/// destroyed while a notice is delivered: its handler is no longer called then.
class NoticeObservers {
public:
    [[nodiscard]] std::unique_ptr<Handle> add(std::string name, std::function<void()> handler) {
        auto entry = std::make_shared<const Entry>(Entry{std::move(name), std::move(handler)});
        m_entries.push_back(entry);
        return std::make_unique<EntryHandle>(std::move(entry));
    }

    /// Calls those of `name`, in the order in which they were added.
    void deliver(const std::string& name) {
        deliverIf([&](const Entry& entry) { return entry.name == name; });
    }

    void deliverAll() {
        deliverIf([](const Entry&) { return true; });
    }

private:
    struct Entry {
        std::string name;
        std::function<void()> handler;
    };

    struct EntryHandle final : Handle {
        explicit EntryHandle(std::shared_ptr<const Entry> held)
            : entry(std::move(held)) {}
        std::shared_ptr<const Entry> entry;
    };

    void deliverIf(auto wanted) {
        std::erase_if(m_entries, [](const auto& entry) { return entry.expired(); });
        const auto entries = m_entries; // handlers add to the list
        for (const auto& weak : entries) {
            if (const auto entry = weak.lock(); entry && wanted(*entry)) entry->handler();
        }
    }

    std::vector<std::weak_ptr<const Entry>> m_entries;
};

} // namespace platform
