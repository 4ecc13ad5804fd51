#pragma once

#include <any>
#include <functional>
#include <memory>
#include <string>
#include <vector>

/// What an observer is told: a name, whom it is about, and details. The library that posts says what the two
/// values hold; a local notification's `object` is the sender's address as `const void*`.
struct KXNotification {
    std::string name;
    std::any object;
    std::any userInfo;
};

/// Notifications within one process, delivered at once on the poster's thread, in the order of registration.
/// Main thread only. Observers may add and remove observers while being called; one that was removed is no
/// longer called.
class KXNotificationCenter {
public:
    using Handler = std::function<void(const KXNotification&)>;

    /// The centre that everybody in the process shares.
    static KXNotificationCenter& defaultCenter();

    /// Calls `handler` for every notification of that name; with `object`, only for those it sends. `owner`
    /// is the token for removal, never dereferenced.
    void addObserver(const void* owner, std::string name, const void* object, Handler handler);
    void removeObserver(const void* owner);
    void postNotification(const std::string& name, const void* object);

private:
    struct Entry {
        const void* owner;
        std::string name;
        const void* object;
        Handler handler;
        bool removed = false;
    };
    std::vector<std::shared_ptr<Entry>> m_entries;
};
