#include "platform/linux/Destination.h"

#include "lib/base/Log.h"
#include "platform/Clock.h"
#include "platform/MessagePort.h"
#include "platform/linux/Descriptor.h"
#include "platform/linux/OutgoingMessage.h"
#include "platform/linux/OutgoingQueue.h"
#include "platform/linux/PortAnswer.h"
#include "platform/linux/PortNames.h"
#include "platform/linux/PortPacket.h"
#include "platform/linux/PortTap.h"
#include "platform/linux/SealedMemory.h"

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <fcntl.h>
#include <linux/sockios.h>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <unistd.h>
#include <utility>

namespace platform {

namespace {

// The system bounds what is on its way by the size of packets, whatever is in memory behind them.
constexpr std::size_t maximalOnTheWay = std::size_t{64} << 20;

SendStatus StatusFrom(Sending sending) {
    switch (sending) {
    case Sending::taken:
        return SendStatus::success;
    case Sending::hungUp:
        return SendStatus::isInvalid;
    default:
        return SendStatus::transportError;
    }
}

/// Bytes of packets that are on their way, with what the system needs to keep them.
int Unread(const Descriptor& socket) {
    int bytes = 0;
    ioctl(socket.get(), SIOCOUTQ, &bytes);
    return bytes;
}

bool MustWait(Sending sending) {
    return sending == Sending::busy || sending == Sending::exhausted;
}

} // namespace

Destination::Destination(const PortNames& names, const Clock& clock, PortTap& tap, Delegate& delegate,
                         std::string name)
    : m_names(names)
    , m_clock(clock)
    , m_tap(tap)
    , m_delegate(delegate)
    , m_name(std::move(name))
    , m_queue(tap.counters) {}

bool Destination::connect() {
    const std::lock_guard lock(m_mutex);
    // Whether that one has ended, the next message will tell.
    m_isBelieved = m_socket || openConnection() != Sending::hungUp;
    return m_isBelieved;
}

SendStatus Destination::send(BytePieces pieces, bool synchronous, RemotePort::Timeouts timeouts) {
    const auto sequence = synchronous ? ++m_sequence : 0;
    const auto message = OutgoingMessage::make(pieces, synchronous, sequence, m_inlineLimit);
    if (!message) return SendStatus::transportError;
    std::unique_lock lock(m_mutex);
    if (m_queue.isEmpty() && (synchronous || !isReceiverBehind(*message))) {
        const auto [sending, socket] = transmit(lock, *message);
        if (!MustWait(sending)) {
            if (!synchronous || sending != Sending::taken) return StatusFrom(sending);
            lock.unlock();
            return awaitAnswer(socket, sequence, timeouts.receive);
        }
    }
    const auto now = m_clock.now();
    giveUpOverdue(now);
    if (!m_queue.hasRoomFor(*message)) {
        noteDrop();
        return synchronous ? SendStatus::sendTimeout : SendStatus::success;
    }
    const auto waiting = enqueue(*message, now + timeouts.send);
    return synchronous ? awaitTurn(lock, waiting, sequence, timeouts) : SendStatus::success;
}

void Destination::drain() {
    const std::lock_guard lock(m_mutex);
    if (m_socket && DrainAnswers(m_socket->get()) != Reading::nothing) endConnection();
}

bool Destination::takeEnd() {
    const std::lock_guard lock(m_mutex);
    return std::exchange(m_ended, false);
}

bool Destination::isIdle() const {
    const std::lock_guard lock(m_mutex);
    return !m_socket && m_queue.isEmpty() && !m_ended;
}

Destination::Socket Destination::socket() const {
    const std::lock_guard lock(m_mutex);
    return m_socket;
}

std::optional<Destination::Pending> Destination::flush() {
    std::unique_lock lock(m_mutex);
    giveUpOverdue(m_clock.now());
    while (!m_queue.isEmpty()) {
        const auto sending = transmitFirst(lock);
        if (MustWait(sending))
            return Pending{sending == Sending::busy ? m_socket : nullptr, m_queue.first()->packet.deadline()};
        if (sending == Sending::taken) continue;
        // Without a receiver the rest has nowhere to go either.
        const auto given = sending == Sending::hungUp ? m_queue.size() : 1;
        for (std::size_t i = 0; i < given; ++i)
            giveUpFirst(StatusFrom(sending));
    }
    m_isFlushed = false;
    return std::nullopt;
}

/// Taken, if there is one now.
Sending Destination::openConnection() {
    Descriptor socket;
    switch (m_names.connect(m_name, socket)) {
    case PortNames::Connecting::refused:
        return Sending::hungUp;
    case PortNames::Connecting::busy:
        return Sending::exhausted;
    case PortNames::Connecting::done:
        break;
    }
    int sendBuffer = 0;
    socklen_t size = sizeof sendBuffer;
    getsockopt(socket.get(), SOL_SOCKET, SO_SNDBUF, &sendBuffer, &size);
    m_inlineLimit = InlineLimit(sendBuffer);
    // Only connecting must not wait, and whoever reads or writes says whether he does.
    fcntl(socket.get(), F_SETFL, 0);
    m_socket = std::make_shared<const Descriptor>(std::move(socket));
    m_warned = false;
    m_delegate.didChangeConnection(m_name);
    return Sending::taken;
}

Sending Destination::reopenConnection() {
    if (m_socket) return Sending::taken;
    const auto opening = openConnection();
    // Whoever was told of an owner that was only too busy has to hear of its end, too.
    if (opening == Sending::hungUp && m_isBelieved) endConnection();
    return opening;
}

Sending Destination::transmitFirst(std::unique_lock<std::mutex>& lock) {
    const auto waiting = m_queue.first();
    waiting->packet.close();
    m_isTransmitting = true;
    const auto [sending, socket] = transmit(lock, waiting->packet);
    m_isTransmitting = false;
    if (sending == Sending::taken) {
        waiting->takenBy = socket;
        m_queue.removeFirstPacket();
    }
    m_changed.notify_all();
    return sending;
}

/// Unlocks while the system copies the packet: an asynchronous sender must not wait for that.
template <class Packet>
Destination::Transmission Destination::transmit(std::unique_lock<std::mutex>& lock, const Packet& packet) {
    const auto sizeInMemory = packet.sizeInMemory();
    for (int attempt = 0; attempt < 2; ++attempt) {
        const auto opening = reopenConnection();
        if (opening != Sending::taken) return {opening};
        if (sizeInMemory > 0 && !hasRoomOnTheWay(sizeInMemory)) return {Sending::exhausted};
        const auto socket = m_socket;
        lock.unlock();
        const auto sending = packet.send(socket->get());
        if (sending == Sending::taken) m_tap.didSend(packet, socket->get());
        lock.lock();
        if (sending == Sending::taken) m_onTheWay += sizeInMemory;
        if (sending != Sending::hungUp) return {sending, socket};
        if (m_socket == socket) endConnection();
    }
    return {Sending::hungUp};
}

bool Destination::hasRoomOnTheWay(std::size_t size) {
    if (m_onTheWay == 0 || m_onTheWay + size <= maximalOnTheWay) return true;
    if (Unread(*m_socket) == 0) m_onTheWay = 0;
    return m_onTheWay == 0;
}

/// Then a small message would wait for it anyway, and goes to the flusher, which sends it at once with those
/// that come meanwhile: in packets of their own they cost both ends twice as much. Asked for one message in
/// many, as asking costs a call.
bool Destination::isReceiverBehind(const OutgoingMessage& message) {
    constexpr int manyPackets = 16'384;
    if (message.size() > smallPacket || ++m_asked % 32 != 0 || !m_socket) return false;
    return Unread(*m_socket) > manyPackets;
}

void Destination::endConnection() {
    m_socket.reset();
    m_onTheWay = 0;
    m_isBelieved = false;
    m_ended = true;
    m_delegate.didChangeConnection(m_name);
}

OutgoingQueue::Pointer Destination::enqueue(const OutgoingMessage& message, Clock::Instant deadline) {
    auto waiting = m_queue.add(message, deadline, m_inlineLimit);
    if (!m_isFlushed) m_isFlushed = m_delegate.didQueue(shared_from_this());
    return waiting;
}

SendStatus Destination::awaitTurn(std::unique_lock<std::mutex>& lock, const OutgoingQueue::Pointer& waiting,
                                  std::uint64_t sequence, RemotePort::Timeouts timeouts) {
    const auto isDone = [&] { return waiting->takenBy || waiting->fate; };
    m_changed.wait_for(lock, timeouts.send, isDone);
    // Only the main thread adds to the queue, and it was here: the message is the last.
    m_changed.wait(lock, [&] { return isDone() || !m_isTransmitting || m_queue.first() != waiting; });
    if (waiting->fate) return *waiting->fate;
    if (const auto socket = waiting->takenBy) {
        lock.unlock();
        return awaitAnswer(socket, sequence, timeouts.receive);
    }
    m_queue.removeLast();
    noteDrop();
    return SendStatus::sendTimeout;
}

SendStatus Destination::awaitAnswer(const Socket& socket, std::uint64_t sequence,
                                    std::chrono::milliseconds timeout) {
    const auto reading = m_answers.await(socket, sequence, timeout);
    if (reading == Reading::packet) return SendStatus::success;
    if (reading == Reading::nothing) return SendStatus::receiveTimeout;
    const std::lock_guard lock(m_mutex);
    if (m_socket == socket) endConnection();
    return SendStatus::becameInvalid;
}

void Destination::giveUpOverdue(Clock::Instant now) {
    while (!m_queue.isEmpty() && !m_isTransmitting && m_queue.first()->packet.deadline() <= now)
        giveUpFirst(SendStatus::sendTimeout);
}

void Destination::giveUpFirst(SendStatus fate) {
    m_queue.giveUpFirst(fate);
    m_changed.notify_all();
    noteDrop();
}

/// Says it once for each connection.
void Destination::noteDrop() {
    ++m_tap.counters.dropped;
    if (std::exchange(m_warned, true)) return;
    Warning("IPC: %s: dropping messages to %s, which does not take them\n", "Destination", m_name.c_str());
}

} // namespace platform
