#pragma once

#include "platform/linux/Descriptor.h"
#include "platform/linux/PortPacket.h"
#include "platform/linux/SealedMemory.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <sys/uio.h>
#include <vector>

namespace platform {

/// What goes along with a packet in memory; null with one that is inline.
using PacketMemory = std::shared_ptr<const Descriptor>;

/// Sends a packet gathered from these parts. Never blocks.
Sending SendPacket(int socket, std::span<iovec> parts, const PacketMemory& memory);

/// A message on its way out. Borrows what goes inline.
class OutgoingMessage {
public:
    /// What does not go inline is written to memory here. Nothing, with a warning, when it is too large or
    /// there is no memory.
    static std::optional<OutgoingMessage> make(BytePieces pieces, bool wantsAnswer, std::uint64_t sequence,
                                               std::size_t inlineLimit = maximalInlinePayload);
    OutgoingMessage(const PacketHeader& header, BytePieces pieces, PacketMemory memory)
        : m_header(header)
        , m_pieces(pieces)
        , m_memory(std::move(memory)) {}

    /// By itself. Never blocks.
    Sending send(int socket) const { return send(socket, m_header); }
    /// The same payload under other flags.
    Sending sendCopy(int socket, std::uint16_t flags, std::uint64_t sequence) const;
    /// Adds what goes inline, with the header.
    void appendTo(std::vector<std::byte>& bytes) const { append(m_header, bytes); }

    const PacketHeader& header() const { return m_header; }
    const PacketMemory& memory() const { return m_memory; }
    std::size_t size() const { return m_header.payloadLength; }
    std::size_t sizeInMemory() const { return m_memory ? size() : 0; }

private:
    Sending send(int socket, const PacketHeader& header) const;
    void append(const PacketHeader& header, std::vector<std::byte>& bytes) const;
    template <class Take>
    void forEachPart(const PacketHeader& header, const Take& take) const;

    PacketHeader m_header;
    BytePieces m_pieces;
    PacketMemory m_memory;
};

} // namespace platform
