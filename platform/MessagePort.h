#pragma once

#include "lib/base/SharedBytes.h"
#include "platform/ProcessTable.h"

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <vector>

/// Named local message ports: datagrams in order per sender, with the sender's identity vouched for by the
/// system.
namespace platform {

/// The process that sent a message.
struct PortPeer {
    int processID = 0;
    /// Absent when the process had ended before it could be asked: then only `processID` tells.
    std::optional<ProcessSerialNumber> serialNumber;
};

/// Held while an arrived message waits or is handled. Its end answers a sender that waits for it and gives
/// the sender's quota its room back. Any thread may end it.
class Receipt {
public:
    virtual ~Receipt() = default;
};

struct Arrival {
    SharedBytes bytes;
    PortPeer sender;
    std::unique_ptr<Receipt> receipt;
    PeekBytes peek{}; ///< into `bytes`; none where they are at hand anyway
};

/// A port under our name. The name is taken from the moment it is made until `close`.
class LocalPort {
public:
    virtual ~LocalPort() = default; ///< closes; no thread may be in `run` any more

    /// Hands arrivals to `receiver` on the calling thread until `close`: in order, and those together that
    /// were there together. Never none. What the receiver does not move out ends when it returns.
    using Receiver = std::function<void(std::span<Arrival>)>;
    virtual void run(const Receiver& receiver) = 0;

    /// Gives the name up at once, so that nobody reaches the port when this returns, and makes `run` return
    /// soon. What was not handed over is dropped; receipts that are still held answer when they end. Any
    /// thread; repeatable.
    virtual void close() = 0;
};

enum class SendStatus : int {
    success = 0,
    sendTimeout = -1,
    receiveTimeout = -2,
    isInvalid = -3, ///< nobody listens any more
    transportError = -4,
    becameInvalid = -5, ///< the receiver went away before it had answered
};

/// The way to somebody else's port. All those of one name share a connection, so messages keep their order.
class RemotePort {
public:
    struct Timeouts {
        std::chrono::milliseconds send;
        std::chrono::milliseconds receive;
    };

    virtual ~RemotePort() = default;

    /// Sends the pieces as one message. Asynchronously: returns at once. What the system does not take now,
    /// and what is small and goes to a receiver that is far behind, is sent in the background; what is lost
    /// there, overdue or more than is kept, is logged once per receiver. Synchronously: returns when the
    /// receiver has let go of the message's receipt.
    virtual SendStatus send(std::span<const std::span<const std::byte>> pieces, bool synchronous,
                            Timeouts timeouts) = 0;
};

/// The ports of this user's session. Main thread only, but for what says otherwise. Must outlive what it
/// makes, receipts excepted.
class MessagePorts {
public:
    virtual ~MessagePorts() = default;

    /// Takes the name; null when it is taken or cannot be had. Any thread.
    virtual std::unique_ptr<LocalPort> open(const std::string& name) = 0;

    /// Null when nobody listens on that name.
    virtual std::unique_ptr<RemotePort> connect(const std::string& name) = 0;

    /// Whether somebody listens. After a yes, answers no once when that owner has ended, even when another
    /// owns the name by then, if we were connected to it or tried to be.
    virtual bool isListening(const std::string& name) = 0;

    /// The names that somebody listens on, in order.
    virtual std::vector<std::string> listeningNames() = 0;

    /// Calls `handler` from the main loop when the owner of a port that we were connected to has ended, or
    /// one that was there for `isListening` is gone when we connect.
    using HangUpHandler = std::function<void(const std::string& name)>;
    virtual void setHangUpHandler(HangUpHandler handler) = 0;

    /// How many messages still wait here for their receivers, and how many were given up, all of them sent
    /// asynchronously. Any thread.
    struct Queued {
        std::uint64_t waiting = 0;
        std::uint64_t dropped = 0;
    };
    virtual Queued queued() const = 0;

    /// Whether one more log entry about a peer may be written, ten a minute in all; counts it if so. A peer
    /// is a process id in digits, or the name of a port that is sent to. Any thread.
    virtual bool mayLogAbout(const std::string& peer) = 0;
};

} // namespace platform
