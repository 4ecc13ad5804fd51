#include "platform/linux/PortFlusher.h"

#include "lib/base/Log.h"
#include "platform/Clock.h"
#include "platform/linux/Destination.h"

#include <algorithm>
#include <chrono>
#include <climits>
#include <memory>
#include <mutex>
#include <optional>
#include <poll.h>
#include <sys/eventfd.h>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

namespace platform {

namespace {

using namespace std::chrono_literals;
using std::chrono::steady_clock;

constexpr auto patienceAtEnd = 2s;
constexpr auto retryInterval = 10ms; ///< where there is nothing to wait for

} // namespace

PortFlusher::PortFlusher(const Clock& clock)
    : m_clock(clock)
    , m_wake(eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)) {}

PortFlusher::~PortFlusher() {
    if (!m_thread.joinable()) return;
    {
        const std::lock_guard lock(m_mutex);
        m_end = steady_clock::now() + patienceAtEnd;
    }
    eventfd_write(m_wake.get(), 1);
    m_thread.join();
}

bool PortFlusher::add(std::shared_ptr<Destination> destination) {
    const std::lock_guard lock(m_mutex);
    m_added.push_back(std::move(destination));
    if (m_thread.joinable()) {
        eventfd_write(m_wake.get(), 1);
        return true;
    }
    try {
        m_thread = std::thread([this] { run(); });
        return true;
    } catch (const std::system_error& error) {
        // The next message tries again.
        Warning("IPC: %s: cannot start the thread that sends: %s\n", "PortFlusher::add", error.what());
        m_added.clear();
        return false;
    }
}

void PortFlusher::run() {
    for (;;) {
        const auto end = takeAdded();
        const auto now = steady_clock::now();
        auto wait = std::chrono::milliseconds::max();
        if (end) wait = std::chrono::ceil<std::chrono::milliseconds>(*end - now);
        if (wait <= 0ms) return;
        std::vector<pollfd> polled{{m_wake.get(), POLLIN, 0}};
        const auto sockets = flush(polled, wait);
        if (end && m_active.empty()) return;
        const auto timeout =
            static_cast<int>(std::min<std::chrono::milliseconds::rep>(wait.count(), INT_MAX));
        poll(polled.data(), polled.size(), m_active.empty() ? -1 : timeout);
        eventfd_t ignored = 0;
        eventfd_read(m_wake.get(), &ignored);
    }
}

/// When to end, if so.
std::optional<steady_clock::time_point> PortFlusher::takeAdded() {
    const std::lock_guard lock(m_mutex);
    for (auto& destination : std::exchange(m_added, {})) {
        // One that ran empty and filled again meanwhile is still here.
        if (std::ranges::find(m_active, destination) == m_active.end())
            m_active.push_back(std::move(destination));
    }
    return m_end;
}

/// Adds what is to be polled, and shortens the wait. Sockets are kept open while they are polled.
std::vector<Destination::Socket> PortFlusher::flush(std::vector<pollfd>& polled,
                                                    std::chrono::milliseconds& wait) {
    std::vector<Destination::Socket> sockets;
    std::erase_if(m_active, [&](const auto& destination) {
        const auto pending = destination->flush();
        if (!pending) return true;
        const auto left = std::chrono::ceil<std::chrono::milliseconds>(pending->deadline - m_clock.now());
        wait = std::min(wait, pending->socket ? std::max(left, 0ms) : retryInterval);
        if (!pending->socket) return false;
        polled.push_back({pending->socket->get(), POLLOUT, 0});
        sockets.push_back(pending->socket);
        return false;
    });
    return sockets;
}

} // namespace platform
