#include "platform/linux/PortPacket.h"

#include "lib/base/Log.h"
#include "platform/linux/Descriptor.h"
#include "platform/linux/SealedMemory.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cerrno>
#include <chrono>
#include <climits>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <memory>
#include <optional>
#include <span>
#include <sys/socket.h>
#include <sys/types.h>
#include <sys/uio.h>
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

constexpr int sendFlags = MSG_DONTWAIT | MSG_NOSIGNAL;

/// What the call returns, again while a signal interrupts it.
template <class Call>
auto Uninterrupted(const Call& call) {
    for (;;) {
        const auto result = call();
        if (result >= 0 || errno != EINTR) return result;
    }
}

/// Whatever the sender left unread when it closed is told once, before what it sent, which counts.
template <class Call>
ssize_t DespiteReset(const Call& receive) {
    const auto length = receive();
    return length < 0 && errno == ECONNRESET ? receive() : length;
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
    const auto received = DespiteReset([&] {
        return Uninterrupted([&] { return recvmsg(socket, &message, MSG_DONTWAIT | MSG_CMSG_CLOEXEC); });
    });
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
    const auto sent = Uninterrupted([&] { return ::send(socket, &header, sizeof header, sendFlags); });
    return sent < 0 ? SendingFromErrno() : Sending::taken;
}

namespace {

Reading ReadAnswer(int socket, std::uint64_t& sequence, int wait) {
    PacketHeader header;
    // Told whole how long the packet is; without room for descriptors, the system drops those that come.
    const auto received =
        DespiteReset([&] { return recv(socket, &header, sizeof header, wait | MSG_TRUNC); });
    if (received < 0 && (errno == EAGAIN || errno == EINTR)) return Reading::nothing;
    if (received <= 0) return Reading::end;
    const PacketHeader expected{.flags = PacketHeader::isAnswer, .sequence = header.sequence};
    if (received != sizeof header || std::memcmp(&header, &expected, sizeof header) != 0) return Reading::bad;
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
