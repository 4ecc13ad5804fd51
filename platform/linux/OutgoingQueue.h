#pragma once

#include "platform/Clock.h"
#include "platform/MessagePort.h"
#include "platform/linux/OutgoingMessage.h"
#include "platform/linux/OutgoingPacket.h"
#include "platform/linux/PortTap.h"

#include <cstddef>
#include <deque>
#include <memory>
#include <optional>

namespace platform {

/// The messages to one receiver that the system has not taken yet, and how many of them are kept. For one
/// thread at a time.
class OutgoingQueue {
public:
    struct Waiting {
        OutgoingPacket packet;
        std::shared_ptr<const Descriptor> takenBy{}; ///< the socket, once it is sent
        std::optional<SendStatus> fate{};            ///< once its last message is given up
    };
    using Pointer = std::shared_ptr<Waiting>;

    /// Those of all queues, which must outlive it.
    explicit OutgoingQueue(PortTap::Counters& counters)
        : m_counters(counters) {}

    bool isEmpty() const { return m_packets.empty(); }
    std::size_t size() const { return m_size; } ///< messages
    const Pointer& first() const { return m_packets.front(); }
    bool hasRoomFor(const OutgoingMessage& message) const;

    /// What it was put into, last of all.
    Pointer add(const OutgoingMessage& message, Clock::Instant deadline, std::size_t inlineLimit);
    void removeFirstPacket();
    void giveUpFirst(SendStatus fate);
    void removeLast();

private:
    void count(std::size_t sign, std::size_t messages, std::size_t bytes, bool isInMemory);

    PortTap::Counters& m_counters;
    std::deque<Pointer> m_packets;
    std::size_t m_size = 0;
    std::size_t m_bytes = 0;
    std::size_t m_descriptors = 0;
};

} // namespace platform
