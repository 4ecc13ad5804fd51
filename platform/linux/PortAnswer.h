#pragma once

#include "platform/linux/Descriptor.h"
#include "platform/linux/PortPacket.h"

#include <chrono>
#include <cstdint>
#include <memory>

/// The answers to messages whose senders wait.
namespace platform {

Sending SendAnswer(int socket, std::uint64_t sequence);

/// Throws away the answers that are there. Nothing when the connection goes on.
Reading DrainAnswers(int socket);

/// Waits for answers. For one thread.
class AnswerWait {
public:
    /// A packet once the message of that number is answered, nothing when that takes longer. Throws away the
    /// answers to others: they were not waited for to their end.
    Reading await(const std::shared_ptr<const Descriptor>& socket, std::uint64_t sequence,
                  std::chrono::milliseconds timeout);

private:
    void setPatience(const std::shared_ptr<const Descriptor>& socket, std::chrono::milliseconds time);

    std::chrono::milliseconds m_patience{}; ///< how long a socket waits, and which was told so
    std::weak_ptr<const Descriptor> m_patient;
};

} // namespace platform
