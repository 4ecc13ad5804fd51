#pragma once

#include <cstddef>
#include <functional>
#include <mutex>
#include <unordered_map>

namespace platform {

/// What has arrived at a port and is not handled yet, by sender. Tells whose messages are left where they are
/// for now: in the sender's own queue. Any thread.
class Backlog {
public:
    struct Bounds {
        std::size_t messages; ///< each keeps a mapping at most
        std::size_t bytes;
    };
    /// The last packet that is let in may have a message of any size, or as many as go in one, so a sender
    /// keeps that much more at most. The small number of messages keeps the others' from waiting behind a
    /// flood.
    static constexpr Bounds ofSender{16, std::size_t{64} << 20};
    /// Beyond this, only who has nothing waiting is let in.
    static constexpr Bounds ofAll{4096, std::size_t{512} << 20};

    /// `onRoom` is called, from any thread, when there is room again for somebody who was refused.
    explicit Backlog(std::function<void()> onRoom)
        : m_onRoom(std::move(onRoom)) {}

    /// Whether one more packet of that sender is let in.
    bool admits(int sender);
    void add(int sender, std::size_t bytes);
    void remove(int sender, std::size_t bytes);

private:
    struct Load {
        std::size_t messages = 0;
        std::size_t bytes = 0;
        bool refused = false; ///< since the last call for room

        void add(std::size_t size);
        void remove(std::size_t size);
        bool isWithin(const Bounds& bounds) const;
        bool takeRoom(const Bounds& bounds);
    };

    const std::function<void()> m_onRoom;
    std::mutex m_mutex; ///< guards what follows
    std::unordered_map<int, Load> m_senders;
    Load m_all;
};

} // namespace platform
