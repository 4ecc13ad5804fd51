#include "platform/linux/PortPacket.h"

#include "lib/base/Log.h"
#include "platform/linux/Descriptor.h"
#include "platform/linux/SealedMemory.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <sys/socket.h>
#include <sys/types.h>
#include <sys/uio.h>

#include <bit>
#include <cerrno>
#include <chrono>
#include <climits>
#include <cstring>
#include <utility>
#include <vector>

namespace platform {

static_assert(std::endian::native == std::endian::little, "the header's numbers are little-endian");

namespace {

constexpr std::size_t controlSize = CMSG_SPACE(sizeof(ucred)) + CMSG_SPACE(sizeof(int));

union Control {
    cmsghdr alignment;
    std::byte bytes[controlSize];
};

Sending SendingFromErrno() {
    switch (errno) {
    case EAGAIN:
        return Sending::busy;
    case ENOBUFS:
    case ENOMEM:
    case ETOOMANYREFS: // of descriptors on their way, in all of the user's sockets together
        return Sending::exhausted;
    case EPIPE:
    case ECONNRESET:
    case ENOTCONN:
        return Sending::hungUp;
    default:
        return Sending::failed;
    }
}

Sending SendMessage(int socket, const msghdr& message) {
    for (;;) {
        if (sendmsg(socket, &message, MSG_DONTWAIT | MSG_NOSIGNAL) >= 0) return Sending::taken;
        if (errno != EINTR) return SendingFromErrno();
    }
}

/// -1 with errno. Whatever the sender left unread when it closed is told once, before what it sent, which
/// counts.
ssize_t ReceiveMessage(int socket, msghdr& message, int wait = MSG_DONTWAIT) {
    for (;;) {
        const auto length = recvmsg(socket, &message, wait | MSG_CMSG_CLOEXEC);
        if (length >= 0 || (errno != ECONNRESET && (errno != EINTR || wait == 0))) return length;
    }
}

bool IsTruncated(const msghdr& message) {
    return (message.msg_flags & (MSG_TRUNC | MSG_CTRUNC)) != 0;
}

/// Takes all descriptors over, so that none stays open whatever is wrong with the packet.
std::vector<Descriptor> TakeControl(msghdr& message, ucred& sender) {
    std::vector<Descriptor> descriptors;
    for (auto* control = CMSG_FIRSTHDR(&message); control; control = CMSG_NXTHDR(&message, control)) {
        if (control->cmsg_level != SOL_SOCKET) continue;
        if (control->cmsg_type == SCM_CREDENTIALS) std::memcpy(&sender, CMSG_DATA(control), sizeof sender);
        if (control->cmsg_type != SCM_RIGHTS) continue;
        for (std::size_t offset = 0; CMSG_LEN(offset + sizeof(int)) <= control->cmsg_len;
             offset += sizeof(int)) {
            int number = -1;
            std::memcpy(&number, CMSG_DATA(control) + offset, sizeof number);
            descriptors.emplace_back(number);
        }
    }
    return descriptors;
}

/// What is wrong with a packet; null when nothing is.
const char* PacketFault(const PacketHeader& header, PacketReader::Expecting expected,
                        std::size_t inlineLength, std::size_t descriptors) {
    using Header = PacketHeader;
    constexpr auto ofMessages = Header::wantsAnswer | Header::inMemory | Header::tap;
    constexpr auto ofCopies = ofMessages | Header::isAnswer | Header::outgoing;
    const bool isForListener = expected == PacketReader::Expecting::messages;
    if (header.magic != Header::expectedMagic) return "not a packet";
    if (header.version != Header::currentVersion) return "unknown version";
    if ((header.flags & ~(isForListener ? ofMessages : ofCopies)) != 0) return "unknown flags";
    if (header.payloadLength > maximalPayload) return "too large";
    if (isForListener && header.isTap() && (header.flags != Header::tap || header.payloadLength > 0))
        return "a request to watch with more in it";
    const bool inMemory = (header.flags & Header::inMemory) != 0;
    if (descriptors != (inMemory ? 1 : 0)) return "wrong number of descriptors";
    if (inlineLength != (inMemory ? 0 : header.payloadLength)) return "wrong length";
    return nullptr;
}

} // namespace

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

Sending OutgoingPacket::send(int socket) const {
    return send(socket, m_header);
}

Sending OutgoingPacket::sendCopy(int socket, std::uint16_t flags, std::uint64_t sequence) const {
    auto header = m_header;
    header.flags = static_cast<std::uint16_t>(flags | (header.flags & PacketHeader::inMemory));
    header.sequence = sequence;
    return send(socket, header);
}

Sending OutgoingPacket::send(int socket, PacketHeader header) const {
    std::array<iovec, 8> few;
    std::vector<iovec> many(m_pieces.size() < few.size() ? 0 : m_pieces.size() + 1);
    auto* const vectors = many.empty() ? few.data() : many.data();
    auto* end = vectors;
    *end++ = {&header, sizeof header};
    for (const auto piece : m_pieces)
        *end++ = {const_cast<std::byte*>(piece.data()), piece.size()};
    msghdr message = {};
    message.msg_iov = vectors;
    message.msg_iovlen = static_cast<std::size_t>(end - vectors);
    Control control = {};
    if (m_memory) {
        message.msg_control = &control;
        message.msg_controllen = CMSG_SPACE(sizeof(int));
        auto* rights = CMSG_FIRSTHDR(&message);
        rights->cmsg_level = SOL_SOCKET;
        rights->cmsg_type = SCM_RIGHTS;
        rights->cmsg_len = CMSG_LEN(sizeof(int));
        const int number = m_memory.get();
        std::memcpy(CMSG_DATA(rights), &number, sizeof number);
    }
    return SendMessage(socket, message);
}

Reading PacketReader::read(int socket, IncomingPacket& packet) {
    packet = {};
    std::array<iovec, 2> vectors{
        {{&packet.header, sizeof packet.header}, {m_buffer.get(), maximalInlinePayload}}};
    Control control;
    msghdr message = {};
    message.msg_iov = vectors.data();
    message.msg_iovlen = vectors.size();
    message.msg_control = &control;
    message.msg_controllen = sizeof control;
    const auto received = ReceiveMessage(socket, message);
    if (received < 0) return errno == EAGAIN ? Reading::nothing : Reading::end;
    const auto descriptors = TakeControl(message, packet.sender);
    // An empty packet reads like the end, but has a sender.
    if (received == 0 && packet.sender.pid == 0) return Reading::end;

    const auto length = static_cast<std::size_t>(received);
    if (length < sizeof packet.header || IsTruncated(message)) {
        packet.fault = IsTruncated(message) ? "too much" : "too short";
        return Reading::bad;
    }
    const auto inlineLength = length - sizeof packet.header;
    packet.fault = PacketFault(packet.header, m_expected, inlineLength, descriptors.size());
    if (packet.fault) return Reading::bad;
    if (descriptors.empty()) {
        packet.payload = SharedBytes::copyOf(m_buffer.get(), inlineLength);
        return Reading::packet;
    }
    auto mapped = MapSealedMemory(descriptors.front(), packet.header.payloadLength);
    if (!mapped)
        packet.fault = "memory that is not sealed or not of the announced size";
    else
        packet.payload = std::move(*mapped);
    return packet.fault ? Reading::bad : Reading::packet;
}

Sending SendAnswer(int socket, std::uint64_t sequence) {
    PacketHeader header;
    header.flags = PacketHeader::isAnswer;
    header.sequence = sequence;
    iovec vector{&header, sizeof header};
    msghdr message = {};
    message.msg_iov = &vector;
    message.msg_iovlen = 1;
    return SendMessage(socket, message);
}

namespace {

Reading ReadAnswer(int socket, std::uint64_t& sequence, int wait) {
    PacketHeader header;
    iovec vector{&header, sizeof header};
    msghdr message = {}; // without room for descriptors: the system drops those that come
    message.msg_iov = &vector;
    message.msg_iovlen = 1;
    const auto received = ReceiveMessage(socket, message, wait);
    if (received < 0 && (errno == EAGAIN || errno == EINTR)) return Reading::nothing;
    if (received <= 0) return Reading::end;
    const PacketHeader expected{.flags = PacketHeader::isAnswer, .sequence = header.sequence};
    if (received != sizeof header || IsTruncated(message) ||
        std::memcmp(&header, &expected, sizeof header) != 0)
        return Reading::bad;
    sequence = header.sequence;
    return Reading::packet;
}

} // namespace

Reading ReadAnswer(int socket, std::uint64_t& sequence) {
    return ReadAnswer(socket, sequence, MSG_DONTWAIT);
}

Reading AwaitAnswer(int socket, std::uint64_t& sequence) {
    return ReadAnswer(socket, sequence, 0);
}

void SetPatience(int socket, std::chrono::milliseconds time) {
    const timeval wait{time.count() / 1000, time.count() % 1000 * 1000};
    setsockopt(socket, SOL_SOCKET, SO_RCVTIMEO, &wait, sizeof wait);
}

} // namespace platform
