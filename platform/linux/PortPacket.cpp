#include "platform/linux/PortPacket.h"

#include "platform/linux/Descriptor.h"
#include "platform/linux/PortCalls.h"
#include "platform/linux/SealedMemory.h"

#include <bit>
#include <cerrno>
#include <cstddef>
#include <cstring>
#include <span>
#include <sys/socket.h>
#include <sys/uio.h>
#include <utility>
#include <vector>

namespace platform {

static_assert(std::endian::native == std::endian::little, "the header's numbers are little-endian");

namespace {

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

using Header = PacketHeader;

/// What is wrong with a header in a packet with so many descriptors; null when nothing is.
const char* HeaderFault(const Header& header, bool isForListener, std::size_t descriptors) {
    constexpr auto ofMessages = Header::wantsAnswer | Header::inMemory | Header::tap;
    constexpr auto ofCopies = ofMessages | Header::isAnswer | Header::outgoing;
    if (header.magic != Header::expectedMagic) return "not a packet";
    if (header.version != Header::currentVersion) return "unknown version";
    if ((header.flags & ~(isForListener ? ofMessages : ofCopies)) != 0) return "unknown flags";
    if (header.payloadLength > maximalPayload) return "too large";
    if (isForListener && header.isTap() && (header.flags != Header::tap || header.payloadLength > 0))
        return "a request to watch with more in it";
    if (descriptors != (header.isInMemory() ? 1 : 0)) return "wrong number of descriptors";
    return nullptr;
}

/// Adds the messages, whose payloads are borrowed. What is wrong with any of them; null when nothing is.
const char* Split(std::span<const std::byte> bytes, bool isForListener, std::size_t descriptors,
                  std::vector<IncomingMessage>& messages) {
    do {
        Header header;
        if (messages.size() == largestGroup) return "too many messages";
        if (bytes.size() < sizeof header) return "too short";
        std::memcpy(&header, bytes.data(), sizeof header);
        if (const auto* fault = HeaderFault(header, isForListener, descriptors)) return fault;
        bytes = bytes.subspan(sizeof header);
        const std::size_t length = header.isInMemory() ? 0 : header.payloadLength;
        const bool goesAlone = !isForListener || (header.flags & ~Header::wantsAnswer) != 0;
        if (length > bytes.size() || (goesAlone && (length < bytes.size() || !messages.empty())))
            return "wrong length";
        messages.push_back({header, SharedBytes(bytes.first(length), nullptr)});
        bytes = bytes.subspan(length);
    } while (!bytes.empty());
    return nullptr;
}

} // namespace

Reading PacketReader::read(int socket) {
    m_packet.messages.clear();
    m_packet.sender = {};
    m_packet.fault = nullptr;
    iovec vector{m_buffer.get(), maximalLength};
    Control control;
    msghdr message = {};
    message.msg_iov = &vector;
    message.msg_iovlen = 1;
    message.msg_control = &control;
    message.msg_controllen = sizeof control;
    const auto received = DespiteReset([&] {
        return Uninterrupted([&] { return recvmsg(socket, &message, MSG_DONTWAIT | MSG_CMSG_CLOEXEC); });
    });
    if (received < 0) return errno == EAGAIN ? Reading::nothing : Reading::end;
    auto descriptors = TakeControl(message, m_packet.sender);
    // An empty packet reads like the end, but has a sender.
    if (received == 0 && m_packet.sender.pid == 0) return Reading::end;

    const auto length = static_cast<std::size_t>(received);
    m_packet.fault = IsTruncated(message) ? "too much"
                                          : Split({m_buffer.get(), length}, m_expected == Expecting::messages,
                                                  descriptors.size(), m_packet.messages);
    if (m_packet.fault) return Reading::bad;
    if (descriptors.empty()) {
        own(length);
        return Reading::packet;
    }
    auto& inMemory = m_packet.messages.front();
    auto mapped = MapSealedMemory(descriptors.front(), inMemory.header.payloadLength);
    if (!mapped) {
        m_packet.fault = "memory that is not sealed or not of the announced size";
        return Reading::bad;
    }
    inMemory.payload = std::move(*mapped);
    inMemory.peek = PeekIntoMemory(std::move(descriptors.front()));
    return Reading::packet;
}

/// Copies the payloads out of the buffer: those of a small packet by one copy that they share, so that
/// whoever keeps one of them keeps little more.
void PacketReader::own(std::size_t length) {
    const bool isShared = length <= smallPacket;
    const auto copy = isShared ? SharedBytes::copyOf(m_buffer.get(), length) : SharedBytes();
    for (auto& [header, payload, peek] : m_packet.messages) {
        const auto offset = static_cast<std::size_t>(payload.data() - m_buffer.get());
        payload = isShared ? copy.slice(offset, payload.size())
                           : SharedBytes::copyOf(payload.data(), payload.size());
    }
}

} // namespace platform
