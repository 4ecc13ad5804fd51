#include "platform/linux/PortTap.h"

#include "lib/plist/Binary.h"
#include "lib/plist/Value.h"
#include "platform/linux/IncomingConnection.h"
#include "platform/linux/OutgoingMessage.h"
#include "platform/linux/OutgoingPacket.h"
#include "platform/linux/PortNames.h"
#include "platform/linux/PortPacket.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <span>
#include <string>
#include <sys/socket.h>
#include <unistd.h>
#include <vector>

namespace platform {

void PortTap::add(const std::shared_ptr<IncomingConnection>& watcher, std::uint64_t sequence) {
    // With a usual buffer it would miss, every time, the largest packets that go inline.
    WidenSendBuffer(watcher->socket());
    const std::lock_guard lock(m_mutex);
    std::erase_if(m_watchers, [&](const Watcher& each) {
        const auto connection = each.connection.lock();
        return !connection || connection == watcher; // who asks again gets no second copy of everything
    });
    m_watchers.push_back({watcher});
    m_isWatched = true;
    const auto told = statistics();
    const std::span<const std::byte> pieces[] = {told.span()};
    const auto message = OutgoingMessage::make(pieces, false, sequence);
    if (message) message->sendCopy(watcher->socket(), PacketHeader::tap | PacketHeader::isAnswer, sequence);
}

void PortTap::didReceive(const PacketHeader& header, const SharedBytes& payload, int sender) {
    ++counters.received;
    if (!m_isWatched) return;
    const std::span<const std::byte> pieces[] = {payload.span()};
    const auto flags = header.flags & PacketHeader::wantsAnswer;
    if (const auto message = OutgoingMessage::make(pieces, false, 0))
        copy(*message, static_cast<std::uint16_t>(flags), sender);
}

void PortTap::didSend(const OutgoingMessage& message, int socket) {
    ++counters.sent;
    if (m_isWatched) copySent(message, socket);
}

void PortTap::didSend(const OutgoingPacket& packet, int socket) {
    counters.sent += packet.count();
    if (m_isWatched) packet.forEach([&](const OutgoingMessage& message) { copySent(message, socket); });
}

void PortTap::copySent(const OutgoingMessage& message, int socket) {
    ucred receiver = {};
    socklen_t size = sizeof receiver;
    getsockopt(socket, SOL_SOCKET, SO_PEERCRED, &receiver, &size);
    const auto flags = message.header().flags & PacketHeader::wantsAnswer;
    copy(message, static_cast<std::uint16_t>(flags | PacketHeader::outgoing), receiver.pid);
}

/// A watcher who does not keep up misses what there is no room for, and sees it by the count.
void PortTap::copy(const OutgoingMessage& message, std::uint16_t flags, int otherEnd) {
    flags = static_cast<std::uint16_t>(flags | PacketHeader::tap);
    const std::lock_guard lock(m_mutex);
    std::erase_if(m_watchers, [&](Watcher& watcher) {
        const auto connection = watcher.connection.lock();
        if (!connection) return true;
        const auto sequence = std::uint64_t{watcher.count++} << 32 | static_cast<std::uint32_t>(otherEnd);
        return message.sendCopy(connection->socket(), flags, sequence) == Sending::hungUp;
    });
    m_isWatched = !m_watchers.empty();
}

SharedBytes PortTap::statistics() const {
    const plist::Dictionary values{{"connections", counters.connections - m_watchers.size()},
                                   {"received", counters.received.load()},
                                   {"sent", counters.sent.load()},
                                   {"queued", counters.queued.load()},
                                   {"queuedBytes", counters.queuedBytes.load()},
                                   {"dropped", counters.dropped.load()}};
    std::string error;
    return plist::WriteBinary(values, error).joined();
}

} // namespace platform
