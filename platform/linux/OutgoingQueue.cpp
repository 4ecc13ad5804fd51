#include "platform/linux/OutgoingQueue.h"

#include "platform/Clock.h"
#include "platform/linux/OutgoingPacket.h"
#include "platform/linux/PortPacket.h"

#include <cstddef>
#include <memory>
#include <utility>

namespace platform {

namespace {
// A queue holds so much; one message alone may be of any size.
constexpr std::size_t maximalBytes = maximalPayload;
constexpr std::size_t maximalMessages = 65536;
constexpr std::size_t maximalDescriptors = 128;
} // namespace

bool OutgoingQueue::hasRoomFor(const OutgoingPacket& packet) const {
    return isEmpty() || (m_bytes + packet.size() <= maximalBytes && size() < maximalMessages &&
                         (!packet.hasDescriptor() || m_descriptors < maximalDescriptors));
}

OutgoingQueue::Pointer OutgoingQueue::add(OutgoingPacket packet, Clock::Instant deadline) {
    packet.own();
    count(packet, true);
    m_messages.push_back(std::make_shared<Waiting>(Waiting{std::move(packet), deadline}));
    return m_messages.back();
}

void OutgoingQueue::removeFirst() {
    count(first()->packet, false);
    m_messages.pop_front();
}

void OutgoingQueue::removeLast() {
    count(m_messages.back()->packet, false);
    m_messages.pop_back();
}

void OutgoingQueue::count(const OutgoingPacket& packet, bool isAdded) {
    // Counts are unsigned: minus one wraps to what adds up right.
    const std::size_t sign = isAdded ? 1 : std::size_t{0} - 1;
    m_bytes += sign * packet.size();
    m_descriptors += packet.hasDescriptor() ? sign : 0;
    m_counters.queued += sign;
    m_counters.queuedBytes += sign * packet.size();
}

} // namespace platform
