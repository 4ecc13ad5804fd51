#pragma once

#include "platform/Clock.h"
#include "platform/MessagePort.h"
#include "platform/linux/OutgoingMessage.h"
#include "platform/linux/OutgoingQueue.h"
#include "platform/linux/PortAnswer.h"
#include "platform/linux/PortNames.h"
#include "platform/linux/PortPacket.h"
#include "platform/linux/PortTap.h"

#include <atomic>
#include <condition_variable>
#include <mutex>

namespace platform {

/// A name that we send to: the one connection that is kept to it, and the messages that the system has not
/// taken yet. A connection that has ended is opened anew once before messages are given up.
class Destination : public std::enable_shared_from_this<Destination> {
public:
    using Socket = std::shared_ptr<const Descriptor>;

    /// Called from any thread, with the destination locked.
    class Delegate {
    public:
        virtual ~Delegate() = default;
        /// Messages wait now, and did not before. Whether `flush` will be called until none are left.
        virtual bool didQueue(std::shared_ptr<Destination> destination) = 0;
        /// There is another connection, or none.
        virtual void didChangeConnection(const std::string& name) = 0;
    };

    /// All but the name must outlive it.
    Destination(const PortNames& names, const Clock& clock, PortTap& tap, Delegate& delegate,
                std::string name);

    // For the main thread.

    /// Connects if need be; false when nobody listens.
    bool connect();
    SendStatus send(BytePieces pieces, bool synchronous, RemotePort::Timeouts timeouts);
    /// Throws away answers that nobody waits for any more, and learns of the end of the connection.
    void drain();
    /// Whether a connection has ended since this was asked last.
    bool takeEnd();
    bool isIdle() const; ///< neither a connection nor messages nor an end to tell of

    // For any thread.

    Socket socket() const;

    struct Pending {
        Socket socket; ///< to be waited for until it takes more; null: just try again soon
        Clock::Instant deadline;
    };
    /// Sends what the system takes now and gives up what is overdue. What to wait for, if messages are left.
    std::optional<Pending> flush();

private:
    Sending openConnection();
    Sending reopenConnection();
    struct Transmission {
        Sending sending;
        Socket socket{}; ///< by which it was taken
    };
    template <class Packet>
    Transmission transmit(std::unique_lock<std::mutex>& lock, const Packet& packet);
    Sending transmitFirst(std::unique_lock<std::mutex>& lock);
    void endConnection();
    bool hasRoomOnTheWay(std::size_t size);
    bool isReceiverBehind(const OutgoingMessage& message);
    OutgoingQueue::Pointer enqueue(const OutgoingMessage& message, Clock::Instant deadline);
    SendStatus awaitTurn(std::unique_lock<std::mutex>& lock, const OutgoingQueue::Pointer& waiting,
                         std::uint64_t sequence, RemotePort::Timeouts timeouts);
    SendStatus awaitAnswer(const Socket& socket, std::uint64_t sequence, std::chrono::milliseconds timeout);
    void giveUpOverdue(Clock::Instant now);
    void giveUpFirst(SendStatus fate);
    void noteDrop();

    const PortNames& m_names;
    const Clock& m_clock;
    PortTap& m_tap;
    Delegate& m_delegate;
    const std::string m_name;
    std::uint64_t m_sequence = 0; ///< main thread
    AnswerWait m_answers;         ///< main thread
    std::size_t m_asked = 0;      ///< main thread; whether the receiver is behind
    std::atomic<std::size_t> m_inlineLimit = maximalInlinePayload;

    mutable std::mutex m_mutex; ///< guards what follows; nothing that takes long is done with it
    std::condition_variable m_changed;
    Socket m_socket;
    std::size_t m_onTheWay = 0;    ///< bytes in memory that the receiver may not have taken yet
    OutgoingQueue m_queue;         ///< while there is anything, only the flusher sends
    bool m_isTransmitting = false; ///< the first packet of the queue
    bool m_isFlushed = false;
    bool m_isBelieved = false; ///< `connect` has said that there is an owner
    bool m_ended = false;
    bool m_warned = false; ///< about this connection's receiver
};

} // namespace platform
