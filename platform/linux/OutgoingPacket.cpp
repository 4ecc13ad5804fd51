#include "platform/linux/OutgoingPacket.h"

#include "lib/base/Log.h"
#include "platform/linux/Descriptor.h"
#include "platform/linux/PortCalls.h"
#include "platform/linux/PortPacket.h"
#include "platform/linux/SealedMemory.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <memory>
#include <optional>
#include <span>
#include <sys/socket.h>
#include <sys/uio.h>
#include <vector>

namespace platform {

std::optional<OutgoingPacket> OutgoingPacket::make(BytePieces pieces, bool wantsAnswer,
                                                   std::uint64_t sequence, std::size_t inlineLimit) {
    OutgoingPacket packet;
    packet.m_header.sequence = sequence;
    for (const auto piece : pieces)
        packet.m_header.payloadLength += piece.size();
    if (wantsAnswer) packet.m_header.flags |= PacketHeader::wantsAnswer;
    if (packet.size() > maximalPayload) {
        Warning("IPC: %s: message of %zu bytes is too large\n", "OutgoingPacket::make", packet.size());
        return std::nullopt;
    }
    if (packet.size() <= inlineLimit) {
        packet.m_pieces.assign(pieces.begin(), pieces.end());
        if (pieces.size() >= IOV_MAX) packet.own();
        return packet;
    }
    packet.m_header.flags |= PacketHeader::inMemory;
    packet.m_memory = WriteSealedMemory(pieces);
    if (!packet.m_memory) {
        Warning("IPC: %s: no memory for %zu bytes: %s\n", "OutgoingPacket::make", packet.size(),
                std::strerror(errno));
        return std::nullopt;
    }
    return packet;
}

void OutgoingPacket::own() {
    if (m_memory || m_copy) return;
    m_copy = std::make_shared<std::vector<std::byte>>();
    m_copy->reserve(size());
    for (const auto piece : m_pieces)
        m_copy->insert(m_copy->end(), piece.begin(), piece.end());
    m_pieces.assign(1, *m_copy);
}

/// A packet as the system takes it, with all that this points at.
class OutgoingPacket::Envelope {
public:
    void fill(const OutgoingPacket& packet, const PacketHeader& header, msghdr& message) {
        m_header = header;
        if (packet.m_pieces.size() >= m_few.size()) m_many.resize(packet.m_pieces.size() + 1);
        message = {};
        message.msg_iov = m_many.empty() ? m_few.data() : m_many.data();
        auto* end = message.msg_iov;
        *end++ = {&m_header, sizeof m_header};
        for (const auto piece : packet.m_pieces)
            *end++ = {const_cast<std::byte*>(piece.data()), piece.size()};
        message.msg_iovlen = static_cast<std::size_t>(end - message.msg_iov);
        if (packet.m_memory) attach(packet.m_memory.get(), message);
    }

private:
    void attach(int descriptor, msghdr& message) {
        m_control = {};
        message.msg_control = &m_control;
        message.msg_controllen = CMSG_SPACE(sizeof descriptor);
        auto* rights = CMSG_FIRSTHDR(&message);
        *rights = {CMSG_LEN(sizeof descriptor), SOL_SOCKET, SCM_RIGHTS};
        std::memcpy(CMSG_DATA(rights), &descriptor, sizeof descriptor);
    }

    PacketHeader m_header;
    std::array<iovec, 8> m_few{};
    std::vector<iovec> m_many;
    Control m_control{};
};

Sending OutgoingPacket::sendCopy(int socket, std::uint16_t flags, std::uint64_t sequence) const {
    auto header = m_header;
    header.flags = static_cast<std::uint16_t>(flags | (header.flags & PacketHeader::inMemory));
    header.sequence = sequence;
    return send(socket, header);
}

Sending OutgoingPacket::send(int socket, const PacketHeader& header) const {
    Envelope envelope;
    msghdr message;
    envelope.fill(*this, header, message);
    const auto sent = Uninterrupted([&] { return sendmsg(socket, &message, sendFlags); });
    return sent < 0 ? SendingFromErrno() : Sending::taken;
}

std::size_t OutgoingPacket::sendAll(int socket, std::span<const OutgoingPacket* const> packets,
                                    Sending& sending) {
    if (packets.size() == 1) {
        sending = packets.front()->send(socket);
        return sending == Sending::taken ? 1 : 0;
    }
    std::array<Envelope, largestGroup> envelopes;
    std::array<mmsghdr, largestGroup> messages;
    const auto count = std::min(packets.size(), largestGroup);
    for (std::size_t i = 0; i < count; ++i)
        envelopes[i].fill(*packets[i], packets[i]->m_header, messages[i].msg_hdr);
    const auto sent = Uninterrupted(
        [&] { return sendmmsg(socket, messages.data(), static_cast<unsigned>(count), sendFlags); });
    sending = sent < 0 ? SendingFromErrno() : Sending::taken;
    return sent < 0 ? 0 : static_cast<std::size_t>(sent);
}

} // namespace platform
