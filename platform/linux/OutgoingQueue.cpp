#include "platform/linux/OutgoingQueue.h"

#include "platform/Clock.h"
#include "platform/linux/OutgoingMessage.h"
#include "platform/linux/PortPacket.h"

#include <cstddef>
#include <memory>
#include <utility>
#include <vector>

namespace platform {

namespace {
// A queue holds so much; one message alone may be of any size.
constexpr std::size_t maximalBytes = maximalPayload;
constexpr std::size_t maximalMessages = 65536;
constexpr std::size_t maximalDescriptors = 128;
} // namespace

bool OutgoingQueue::hasRoomFor(const OutgoingMessage& message) const {
    return isEmpty() || (m_bytes + message.size() <= maximalBytes && size() < maximalMessages &&
                         (!message.hasDescriptor() || m_descriptors < maximalDescriptors));
}

std::vector<const OutgoingMessage*> OutgoingQueue::firstPacket(std::size_t inlineLimit) const {
    std::vector<const OutgoingMessage*> packet;
    std::size_t length = 0;
    for (const auto& waiting : m_messages) {
        const auto& message = waiting->message;
        length += message.size() + (packet.empty() ? 0 : sizeof(PacketHeader));
        const bool fits = !message.hasDescriptor() && length <= inlineLimit && packet.size() < largestGroup;
        if (!fits && !packet.empty()) break;
        packet.push_back(&message);
        if (!fits) break;
    }
    return packet;
}

OutgoingQueue::Pointer OutgoingQueue::add(OutgoingMessage message, Clock::Instant deadline) {
    message.own();
    count(message, true);
    m_messages.push_back(std::make_shared<Waiting>(Waiting{std::move(message), deadline}));
    return m_messages.back();
}

void OutgoingQueue::removeFirst() {
    count(first()->message, false);
    m_messages.pop_front();
}

void OutgoingQueue::removeLast() {
    count(m_messages.back()->message, false);
    m_messages.pop_back();
}

void OutgoingQueue::count(const OutgoingMessage& message, bool isAdded) {
    // Counts are unsigned: minus one wraps to what adds up right.
    const std::size_t sign = isAdded ? 1 : std::size_t{0} - 1;
    m_bytes += sign * message.size();
    m_descriptors += message.hasDescriptor() ? sign : 0;
    m_counters.queued += sign;
    m_counters.queuedBytes += sign * message.size();
}

} // namespace platform
