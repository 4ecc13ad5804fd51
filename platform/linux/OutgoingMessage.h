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

/// A message on its way out.
class OutgoingMessage {
public:
    /// Borrows what goes inline until `own`; what does not is written to memory here. Nothing, with a
    /// warning, when it is too large or there is no memory.
    static std::optional<OutgoingMessage> make(BytePieces pieces, bool wantsAnswer, std::uint64_t sequence,
                                               std::size_t inlineLimit = maximalInlinePayload);

    void own();
    /// Never blocks.
    Sending send(int socket) const { return send(socket, m_header); }
    /// Several in one packet, all or none: at most `largestGroup`, inline, owned, and together no longer than
    /// what goes inline of one.
    static Sending sendTogether(int socket, std::span<const OutgoingMessage* const> messages);
    /// The same payload under other flags.
    Sending sendCopy(int socket, std::uint16_t flags, std::uint64_t sequence) const;
    bool wantsAnswer() const { return (m_header.flags & PacketHeader::wantsAnswer) != 0; }
    bool hasDescriptor() const { return static_cast<bool>(m_memory); }
    std::size_t size() const { return m_header.payloadLength; }
    std::uint64_t sequence() const { return m_header.sequence; }

private:
    Sending send(int socket, const PacketHeader& header) const;
    iovec* describe(const PacketHeader& header, iovec* to) const;

    PacketHeader m_header;
    std::vector<std::span<const std::byte>> m_pieces;
    std::shared_ptr<std::vector<std::byte>> m_copy;
    Descriptor m_memory;
};

} // namespace platform
