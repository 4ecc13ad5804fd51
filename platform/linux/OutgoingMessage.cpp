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
    // The simpler call costs a tenth less.
    const bool isOneRun = parts.size() == 1 && !memory;
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
    const auto sent = Uninterrupted([&] {
        return isOneRun ? ::send(socket, parts.front().iov_base, parts.front().iov_len, sendFlags)
                        : sendmsg(socket, &packet, sendFlags);
    });
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
        std::memcpy(small.data(), &header, sizeof header);
        auto* end = small.data() + sizeof header;
        for (const auto piece : m_pieces)
            end = std::ranges::copy(piece, end).out;
        iovec all{small.data(), length};
        return SendPacket(socket, {&all, 1}, nullptr);
    }
    std::array<iovec, 8> few;
    std::vector<iovec> many;
    std::vector<std::byte> joined;
    auto* const parts = m_pieces.size() < few.size() ? few.data() : (many.resize(IOV_MAX), many.data());
    auto* end = parts;
    if (m_pieces.size() < IOV_MAX) {
        *end++ = {const_cast<PacketHeader*>(&header), sizeof header};
        for (const auto piece : m_pieces)
            *end++ = {const_cast<std::byte*>(piece.data()), piece.size()};
    } else {
        append(header, joined);
        *end++ = {joined.data(), joined.size()};
    }
    return SendPacket(socket, {parts, end}, m_memory);
}

void OutgoingMessage::append(const PacketHeader& header, std::vector<std::byte>& bytes) const {
    const auto* const start = reinterpret_cast<const std::byte*>(&header);
    bytes.insert(bytes.end(), start, start + sizeof header);
    for (const auto piece : m_pieces)
        bytes.insert(bytes.end(), piece.begin(), piece.end());
}

} // namespace platform
