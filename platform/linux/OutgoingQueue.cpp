#include "platform/linux/OutgoingQueue.h"

#include "platform/Clock.h"
#include "platform/MessagePort.h"
#include "platform/linux/OutgoingMessage.h"
#include "platform/linux/OutgoingPacket.h"
#include "platform/linux/PortPacket.h"

#include <cstddef>
#include <memory>

namespace platform {

namespace {
// A queue holds so much; one message alone may be of any size.
constexpr std::size_t maximalBytes = maximalPayload;
constexpr std::size_t maximalMessages = 65536;
constexpr std::size_t maximalDescriptors = 128;

// Counts are unsigned: minus one wraps to what adds up right.
constexpr std::size_t added = 1, removed = std::size_t{0} - 1;
} // namespace

bool OutgoingQueue::hasRoomFor(const OutgoingMessage& message) const {
    return isEmpty() || (m_bytes + message.size() <= maximalBytes && size() < maximalMessages &&
                         (!message.memory() || m_descriptors < maximalDescriptors));
}

OutgoingQueue::Pointer OutgoingQueue::add(const OutgoingMessage& message, Clock::Instant deadline,
                                          std::size_t inlineLimit) {
    count(added, 1, message.size(), message.header().isInMemory());
    if (isEmpty() || !m_packets.back()->packet.add(message, deadline, inlineLimit))
        m_packets.push_back(std::make_shared<Waiting>(Waiting{OutgoingPacket(message, deadline)}));
    return m_packets.back();
}

void OutgoingQueue::removeFirstPacket() {
    const auto& packet = first()->packet;
    count(removed, packet.count(), packet.size(), packet.first().isInMemory());
    m_packets.pop_front();
}

void OutgoingQueue::giveUpFirst(SendStatus fate) {
    auto& packet = first()->packet;
    count(removed, 1, packet.first().payloadLength, packet.first().isInMemory());
    packet.removeFirst();
    if (packet.count() > 0) return;
    first()->fate = fate;
    m_packets.pop_front();
}

void OutgoingQueue::removeLast() {
    auto& packet = m_packets.back()->packet;
    count(removed, 1, packet.last().payloadLength, packet.last().isInMemory());
    packet.removeLast();
    if (packet.count() == 0) m_packets.pop_back();
}

void OutgoingQueue::count(std::size_t sign, std::size_t messages, std::size_t bytes, bool isInMemory) {
    m_size += sign * messages;
    m_bytes += sign * bytes;
    m_descriptors += isInMemory ? sign : 0;
    m_counters.queued += sign * messages;
    m_counters.queuedBytes += sign * bytes;
}

} // namespace platform
