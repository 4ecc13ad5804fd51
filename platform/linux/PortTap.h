#pragma once

#include "platform/linux/OutgoingMessage.h"
#include "platform/linux/OutgoingPacket.h"
#include "platform/linux/PortPacket.h"

#include <atomic>
#include <mutex>
#include <vector>

namespace platform {

class IncomingConnection;

/// Who watches the ports of this process, and what there is to tell them. Any thread; costs next to nothing
/// while nobody watches.
class PortTap {
public:
    /// How the ports are doing.
    struct Counters {
        std::atomic<std::uint64_t> connections = 0; ///< to our ports, now
        std::atomic<std::uint64_t> received = 0;
        std::atomic<std::uint64_t> sent = 0;
        std::atomic<std::uint64_t> queued = 0; ///< messages that receivers have not taken yet, now
        std::atomic<std::uint64_t> queuedBytes = 0;
        std::atomic<std::uint64_t> dropped = 0; ///< at this end
    };
    Counters counters;

    /// Tells the watcher how the ports are doing, and from then on what passes, counted from 0, until the
    /// connection ends.
    void add(const std::shared_ptr<IncomingConnection>& watcher, std::uint64_t sequence);

    void didReceive(const PacketHeader& header, const SharedBytes& payload, int sender);
    /// `socket` is the connection it was sent on.
    void didSend(const OutgoingMessage& message, int socket);
    void didSend(const OutgoingPacket& packet, int socket);

private:
    struct Watcher {
        std::weak_ptr<IncomingConnection> connection;
        std::uint32_t count = 0; ///< of what has passed since
    };
    SharedBytes statistics() const; ///< leaves those who watch out
    void copySent(const OutgoingMessage& message, int socket);
    void copy(const OutgoingMessage& message, std::uint16_t flags, int otherEnd);

    std::atomic<bool> m_isWatched = false;
    std::mutex m_mutex; ///< guards what follows
    std::vector<Watcher> m_watchers;
};

} // namespace platform
