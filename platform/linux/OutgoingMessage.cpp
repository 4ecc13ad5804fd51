#include "platform/linux/OutgoingMessage.h"

#include "lib/base/Log.h"
#include "platform/linux/Descriptor.h"
#include "platform/linux/PortCalls.h"
#include "platform/linux/PortPacket.h"
#include "platform/linux/SealedMemory.h"

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

std::optional<OutgoingMessage> OutgoingMessage::make(BytePieces pieces, bool wantsAnswer,
                                                     std::uint64_t sequence, std::size_t inlineLimit) {
    OutgoingMessage message;
    message.m_header.sequence = sequence;
    for (const auto piece : pieces)
        message.m_header.payloadLength += piece.size();
    if (wantsAnswer) message.m_header.flags |= PacketHeader::wantsAnswer;
    if (message.size() > maximalPayload) {
        Warning("IPC: %s: message of %zu bytes is too large\n", "OutgoingMessage::make", message.size());
        return std::nullopt;
    }
    if (message.size() <= inlineLimit) {
        message.m_pieces.assign(pieces.begin(), pieces.end());
        if (pieces.size() >= IOV_MAX) message.own();
        return message;
    }
    message.m_header.flags |= PacketHeader::inMemory;
    message.m_memory = WriteSealedMemory(pieces);
    if (!message.m_memory) {
        Warning("IPC: %s: no memory for %zu bytes: %s\n", "OutgoingMessage::make", message.size(),
                std::strerror(errno));
        return std::nullopt;
    }
    return message;
}

void OutgoingMessage::own() {
    if (m_memory || m_copy) return;
    m_copy = std::make_shared<std::vector<std::byte>>();
    m_copy->reserve(size());
    for (const auto piece : m_pieces)
        m_copy->insert(m_copy->end(), piece.begin(), piece.end());
    m_pieces.assign(1, *m_copy);
}

namespace {

Sending SendPacket(int socket, std::span<iovec> parts, const Descriptor& memory) {
    msghdr packet = {};
    packet.msg_iov = parts.data();
    packet.msg_iovlen = parts.size();
    Control control;
    if (memory) {
        const int descriptor = memory.get();
        control = {};
        packet.msg_control = &control;
        packet.msg_controllen = CMSG_SPACE(sizeof descriptor);
        auto* rights = CMSG_FIRSTHDR(&packet);
        *rights = {CMSG_LEN(sizeof descriptor), SOL_SOCKET, SCM_RIGHTS};
        std::memcpy(CMSG_DATA(rights), &descriptor, sizeof descriptor);
    }
    const auto sent = Uninterrupted([&] { return sendmsg(socket, &packet, sendFlags); });
    return sent < 0 ? SendingFromErrno() : Sending::taken;
}

} // namespace

/// The end of what was written to `to`.
iovec* OutgoingMessage::describe(const PacketHeader& header, iovec* to) const {
    *to++ = {const_cast<PacketHeader*>(&header), sizeof header};
    for (const auto piece : m_pieces)
        *to++ = {const_cast<std::byte*>(piece.data()), piece.size()};
    return to;
}

Sending OutgoingMessage::send(int socket, const PacketHeader& header) const {
    std::array<iovec, 8> few;
    std::vector<iovec> many;
    if (m_pieces.size() >= few.size()) many.resize(m_pieces.size() + 1);
    auto* const parts = many.empty() ? few.data() : many.data();
    return SendPacket(socket, {parts, describe(header, parts)}, m_memory);
}

Sending OutgoingMessage::sendTogether(int socket, std::span<const OutgoingMessage* const> messages) {
    if (messages.size() == 1) return messages.front()->send(socket);
    std::array<iovec, 2 * largestGroup> parts;
    auto* end = parts.data();
    for (const auto* message : messages)
        end = message->describe(message->m_header, end);
    return SendPacket(socket, {parts.data(), end}, {});
}

Sending OutgoingMessage::sendCopy(int socket, std::uint16_t flags, std::uint64_t sequence) const {
    auto header = m_header;
    header.flags = static_cast<std::uint16_t>(flags | (header.flags & PacketHeader::inMemory));
    header.sequence = sequence;
    return send(socket, header);
}

} // namespace platform
