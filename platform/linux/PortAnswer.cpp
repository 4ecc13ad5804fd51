#include "platform/linux/PortAnswer.h"

#include "platform/linux/Descriptor.h"
#include "platform/linux/PortCalls.h"
#include "platform/linux/PortPacket.h"

#include <cerrno>
#include <chrono>
#include <cstdint>
#include <cstring>
#include <memory>
#include <span>
#include <sys/socket.h>

namespace platform {

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

Sending SendAnswer(int socket, std::uint64_t sequence) {
    PacketHeader header;
    header.flags = PacketHeader::isAnswer;
    header.sequence = sequence;
    return SendBytes(socket, std::as_bytes(std::span(&header, 1)));
}

Reading DrainAnswers(int socket) {
    std::uint64_t ignored = 0;
    auto reading = Reading::packet;
    while (reading == Reading::packet)
        reading = ReadAnswer(socket, ignored, MSG_DONTWAIT);
    return reading;
}

Reading AnswerWait::await(const std::shared_ptr<const Descriptor>& socket, std::uint64_t sequence,
                          std::chrono::milliseconds timeout) {
    using std::chrono::steady_clock;
    const auto deadline = steady_clock::now() + timeout;
    for (auto left = timeout; left.count() > 0;
         left = std::chrono::ceil<std::chrono::milliseconds>(deadline - steady_clock::now())) {
        setPatience(socket, left);
        std::uint64_t answered = 0;
        const auto reading = ReadAnswer(socket->get(), answered, 0); // or until a signal comes
        const bool isOver = reading == Reading::end || reading == Reading::bad;
        if (isOver || (reading == Reading::packet && answered == sequence)) return reading;
    }
    return Reading::nothing;
}

void AnswerWait::setPatience(const std::shared_ptr<const Descriptor>& socket,
                             std::chrono::milliseconds time) {
    if (m_patience == time && m_patient.lock() == socket) return;
    m_patience = time;
    m_patient = socket;
    const timeval wait{time.count() / 1000, time.count() % 1000 * 1000};
    setsockopt(socket->get(), SOL_SOCKET, SO_RCVTIMEO, &wait, sizeof wait);
}

} // namespace platform
