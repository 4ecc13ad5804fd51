#pragma once

#include "platform/Clock.h"
#include "platform/linux/OutgoingMessage.h"
#include "platform/linux/PortPacket.h"

#include <array>
#include <cstddef>
#include <vector>

namespace platform {

/// Messages that wait to be sent together, as they go on the wire: one, or several small ones.
class OutgoingPacket {
public:
    /// Copies what goes inline.
    OutgoingPacket(const OutgoingMessage& message, Clock::Instant deadline);

    /// Whether the message goes along, behind the others.
    bool add(const OutgoingMessage& message, Clock::Instant deadline, std::size_t inlineLimit);
    /// Nothing is added any more.
    void close() { m_isClosed = true; }
    void removeFirst();
    void removeLast();

    /// All or none. Never blocks.
    Sending send(int socket) const;

    std::size_t count() const { return m_end - m_first; }
    Clock::Instant deadline() const { return m_deadlines[m_first]; } ///< of the first
    PacketHeader first() const { return headerAt(m_begin); }
    PacketHeader last() const { return headerAt(lastBegin()); }
    const PacketMemory& memory() const { return m_memory; }
    std::size_t sizeInMemory() const { return m_memory ? first().payloadLength : 0; }
    /// Of all payloads.
    std::size_t size() const {
        return sizeInMemory() + m_bytes.size() - m_begin - count() * sizeof(PacketHeader);
    }

    template <class Visit>
    void forEach(const Visit& visit) const {
        for (auto at = m_begin; at < m_bytes.size(); at = nextAfter(at)) {
            const auto bytes = std::span(m_bytes).subspan(at + sizeof(PacketHeader), inlineLength(at));
            const std::span<const std::byte> pieces[] = {bytes};
            visit(OutgoingMessage(headerAt(at), pieces, m_memory));
        }
    }

private:
    PacketHeader headerAt(std::size_t at) const;
    std::size_t inlineLength(std::size_t at) const { return m_memory ? 0 : headerAt(at).payloadLength; }
    std::size_t nextAfter(std::size_t at) const { return at + sizeof(PacketHeader) + inlineLength(at); }
    std::size_t lastBegin() const;

    std::vector<std::byte> m_bytes;
    std::size_t m_begin = 0; ///< of the first in the bytes
    std::array<Clock::Instant, largestGroup> m_deadlines;
    std::size_t m_first = 0, m_end = 1; ///< of those that are left, in the deadlines
    PacketMemory m_memory;
    bool m_isClosed = false;
};

} // namespace platform
