#pragma once

#include "platform/Clock.h"
#include "platform/MessagePort.h"
#include "platform/linux/OutgoingMessage.h"
#include "platform/linux/PortTap.h"

#include <cstddef>
#include <deque>
#include <memory>
#include <optional>
#include <vector>

namespace platform {

/// The messages to one receiver that the system has not taken yet, and how many of them are kept. For one
/// thread at a time.
class OutgoingQueue {
public:
    struct Waiting {
        OutgoingMessage message;
        Clock::Instant deadline;
        std::shared_ptr<const Descriptor> takenBy{}; ///< the socket, once it is sent
        std::optional<SendStatus> fate{};            ///< once it is given up
    };
    using Pointer = std::shared_ptr<Waiting>;

    /// Those of all queues, which must outlive it.
    explicit OutgoingQueue(PortTap::Counters& counters)
        : m_counters(counters) {}

    bool isEmpty() const { return m_messages.empty(); }
    std::size_t size() const { return m_messages.size(); }
    const Pointer& first() const { return m_messages.front(); }
    /// The first, and those after it that go in one packet with it; they stay where they are while they are
    /// queued.
    std::vector<const OutgoingMessage*> firstPacket(std::size_t inlineLimit) const;
    bool hasRoomFor(const OutgoingMessage& message) const;

    Pointer add(OutgoingMessage message, Clock::Instant deadline);
    void removeFirst();
    void removeLast();

private:
    void count(const OutgoingMessage& message, bool isAdded);

    PortTap::Counters& m_counters;
    std::deque<Pointer> m_messages;
    std::size_t m_bytes = 0;
    std::size_t m_descriptors = 0;
};

} // namespace platform
