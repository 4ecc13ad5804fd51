#include "platform/linux/OutgoingPacket.h"

#include "platform/Clock.h"
#include "platform/linux/OutgoingMessage.h"
#include "platform/linux/PortCalls.h"
#include "platform/linux/PortPacket.h"

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <span>
#include <sys/uio.h>

namespace platform {

OutgoingPacket::OutgoingPacket(const OutgoingMessage& message, Clock::Instant deadline)
    : m_memory(message.memory()) {
    m_bytes.reserve(sizeof(PacketHeader) + message.size() - message.sizeInMemory());
    message.appendTo(m_bytes);
    m_deadlines.front() = deadline;
}

bool OutgoingPacket::add(const OutgoingMessage& message, Clock::Instant deadline, std::size_t inlineLimit) {
    const auto length = m_bytes.size() + sizeof(PacketHeader) + message.size();
    if (m_isClosed || m_memory || message.memory() || m_end == largestGroup ||
        length > std::min(smallPacket, sizeof(PacketHeader) + inlineLimit))
        return false;
    message.appendTo(m_bytes);
    m_deadlines[m_end++] = deadline;
    return true;
}

void OutgoingPacket::removeFirst() {
    m_begin = nextAfter(m_begin);
    ++m_first;
}

void OutgoingPacket::removeLast() {
    m_bytes.resize(lastBegin());
    --m_end;
}

Sending OutgoingPacket::send(int socket) const {
    const auto bytes = std::span(m_bytes).subspan(m_begin);
    if (!m_memory) return SendBytes(socket, bytes);
    iovec part{const_cast<std::byte*>(bytes.data()), bytes.size()};
    return SendPacket(socket, {&part, 1}, m_memory);
}

PacketHeader OutgoingPacket::headerAt(std::size_t at) const {
    PacketHeader header;
    std::memcpy(&header, m_bytes.data() + at, sizeof header);
    return header;
}

std::size_t OutgoingPacket::lastBegin() const {
    auto at = m_begin;
    for (auto next = nextAfter(at); next < m_bytes.size(); next = nextAfter(next))
        at = next;
    return at;
}

} // namespace platform
