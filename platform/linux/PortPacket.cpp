#include "platform/linux/PortPacket.h"

#include "platform/linux/Descriptor.h"
#include "platform/linux/PortCalls.h"
#include "platform/linux/SealedMemory.h"

#include <array>
#include <bit>
#include <cerrno>
#include <cstddef>
#include <cstring>
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
    auto descriptors = TakeControl(message, packet.sender);
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
    if (!mapped) {
        packet.fault = "memory that is not sealed or not of the announced size";
        return Reading::bad;
    }
    packet.payload = std::move(*mapped);
    packet.peek = PeekIntoMemory(std::move(descriptors.front()));
    return Reading::packet;
}

} // namespace platform
