#include "platform/linux/OutgoingMessage.h"

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
#include <utility>
#include <vector>

namespace platform {

Sending SendPacket(int socket, std::span<iovec> parts, const PacketMemory& memory) {
    msghdr packet = {};
    packet.msg_iov = parts.data();
    packet.msg_iovlen = parts.size();
    Control control;
    if (memory) {
        const int descriptor = memory->get();
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

std::optional<OutgoingMessage> OutgoingMessage::make(BytePieces pieces, bool wantsAnswer,
                                                     std::uint64_t sequence, std::size_t inlineLimit) {
    PacketHeader header{.sequence = sequence};
    for (const auto piece : pieces)
        header.payloadLength += piece.size();
    if (wantsAnswer) header.flags |= PacketHeader::wantsAnswer;
    if (header.payloadLength > maximalPayload) {
        Warning("IPC: %s: message of %zu bytes is too large\n", "OutgoingMessage::make",
                static_cast<std::size_t>(header.payloadLength));
        return std::nullopt;
    }
    if (header.payloadLength <= inlineLimit) return OutgoingMessage(header, pieces, nullptr);
    header.flags |= PacketHeader::inMemory;
    auto memory = WriteSealedMemory(pieces);
    if (!memory) {
        Warning("IPC: %s: no memory for %zu bytes: %s\n", "OutgoingMessage::make",
                static_cast<std::size_t>(header.payloadLength), std::strerror(errno));
        return std::nullopt;
    }
    return OutgoingMessage(header, {}, std::make_shared<const Descriptor>(std::move(memory)));
}

Sending OutgoingMessage::sendCopy(int socket, std::uint16_t flags, std::uint64_t sequence) const {
    auto header = m_header;
    header.flags = static_cast<std::uint16_t>(flags | (header.flags & PacketHeader::inMemory));
    header.sequence = sequence;
    return send(socket, header);
}

Sending OutgoingMessage::send(int socket, const PacketHeader& header) const {
    std::array<std::byte, 1024> small;
    const auto length = sizeof header + size() - sizeInMemory();
    if (!m_memory && length <= small.size()) {
        auto* end = small.data();
        forEachPart(header, [&](std::span<const std::byte> part) { end = std::ranges::copy(part, end).out; });
        return SendBytes(socket, {small.data(), end});
    }
    if (m_pieces.size() >= IOV_MAX) {
        std::vector<std::byte> joined;
        joined.reserve(length);
        append(header, joined);
        return SendBytes(socket, joined);
    }
    std::vector<iovec> parts;
    parts.reserve(m_pieces.size() + 1);
    forEachPart(header, [&](std::span<const std::byte> part) {
        parts.push_back({const_cast<std::byte*>(part.data()), part.size()});
    });
    return SendPacket(socket, parts, m_memory);
}

void OutgoingMessage::append(const PacketHeader& header, std::vector<std::byte>& bytes) const {
    forEachPart(header, [&](std::span<const std::byte> part) {
        bytes.insert(bytes.end(), part.begin(), part.end());
    });
}

template <class Take>
void OutgoingMessage::forEachPart(const PacketHeader& header, const Take& take) const {
    take(std::as_bytes(std::span(&header, 1)));
    for (const auto piece : m_pieces)
        take(piece);
}

} // namespace platform
