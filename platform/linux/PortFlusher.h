#pragma once

#include "platform/linux/Destination.h"

#include <memory>
#include <mutex>
#include <poll.h>
#include <thread>
#include <vector>

namespace platform {

/// The thread that sends what the system did not take at once. Started when there is something to send.
class PortFlusher {
public:
    /// The clock of the messages' deadlines.
    explicit PortFlusher(const Clock& clock);
    /// Goes on sending what waits, for two seconds at most.
    ~PortFlusher();
    PortFlusher(const PortFlusher&) = delete;
    PortFlusher& operator=(const PortFlusher&) = delete;

    /// For a destination whose queue is no longer empty. False when there is no thread to be had. Main
    /// thread.
    bool add(std::shared_ptr<Destination> destination);

private:
    using Instant = std::chrono::steady_clock::time_point;
    using Destinations = std::vector<std::shared_ptr<Destination>>;

    void run();
    std::optional<Instant> takeAdded();
    std::vector<Destination::Socket> flush(std::vector<pollfd>& polled, std::chrono::milliseconds& wait);

    const Clock& m_clock;
    const Descriptor m_wake;
    Destinations m_active; ///< the thread's own
    std::mutex m_mutex;    ///< guards what follows
    Destinations m_added;
    std::thread m_thread;
    std::optional<Instant> m_end;
};

} // namespace platform
