#include "platform/linux/PollMainLoop.h"

#include "platform/Clock.h"
#include "platform/MainLoop.h"

#include <algorithm>
#include <array>
#include <chrono>
#include <climits>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <functional>
#include <iterator>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <set>
#include <span>
#include <sys/epoll.h>
#include <sys/eventfd.h>
#include <utility>
#include <vector>

namespace platform {

struct PollMainLoop::Timer {
    Clock::Instant due;
    Milliseconds interval;
    Task task;
    bool live = true;
};

struct PollMainLoop::Watch {
    int descriptor;
    Task task;
    bool live = true;
};

/// Which descriptors are waited for. Two watches may share one.
class PollMainLoop::Poll {
public:
    /// The wake is told of once for each time that it is written, and never read.
    explicit Poll(int wake)
        : m_wake(wake) {
        control(EPOLL_CTL_ADD, wake, EPOLLIN | EPOLLET);
    }

    void add(int descriptor) {
        if (++m_watches[descriptor] > 1) return;
        // Files that cannot be waited for can always be read.
        if (!control(EPOLL_CTL_ADD, descriptor, EPOLLIN)) m_alwaysReadable.insert(descriptor);
    }
    void remove(int descriptor) {
        if (--m_watches[descriptor] > 0) return;
        m_watches.erase(descriptor);
        if (m_alwaysReadable.erase(descriptor) == 0) control(EPOLL_CTL_DEL, descriptor, 0);
    }
    /// Waits, and answers what can be read besides the wake.
    std::set<int> wait(int timeout) {
        std::array<epoll_event, 32> events;
        const int count = epoll_wait(m_epoll.get(), events.data(), static_cast<int>(events.size()),
                                     m_alwaysReadable.empty() ? timeout : 0);
        auto readable = m_alwaysReadable;
        for (const auto& event : std::span(events).first(static_cast<std::size_t>(std::max(count, 0))))
            if (event.data.fd != m_wake) readable.insert(event.data.fd);
        return readable;
    }

private:
    bool control(int operation, int descriptor, std::uint32_t events) {
        epoll_event event = {};
        event.events = events;
        event.data.fd = descriptor;
        return epoll_ctl(m_epoll.get(), operation, descriptor, &event) == 0;
    }

    const int m_wake;
    const Descriptor m_epoll{epoll_create1(EPOLL_CLOEXEC)};
    std::map<int, int> m_watches; ///< how many, by descriptor
    std::set<int> m_alwaysReadable;
};

namespace {

/// The loop lets go of an entry that is no longer live at its next turn: it may be the one that is running.
template <typename Entry>
class EntryHandle final : public Handle {
public:
    explicit EntryHandle(std::shared_ptr<Entry> entry)
        : m_entry(std::move(entry)) {}
    ~EntryHandle() override { m_entry->live = false; }
    EntryHandle(const EntryHandle&) = delete;
    EntryHandle& operator=(const EntryHandle&) = delete;

private:
    std::shared_ptr<Entry> m_entry;
};

/// The descriptor may be closed, and its number another's, once the handle has ended.
template <typename Entry, typename Poll>
class WatchHandle final : public Handle {
public:
    WatchHandle(std::shared_ptr<Entry> watch, std::shared_ptr<Poll> poll)
        : m_watch(watch)
        , m_descriptor(watch->descriptor)
        , m_poll(std::move(poll)) {}
    ~WatchHandle() override { m_poll->remove(m_descriptor); }
    WatchHandle(const WatchHandle&) = delete;
    WatchHandle& operator=(const WatchHandle&) = delete;

private:
    const EntryHandle<Entry> m_watch;
    const int m_descriptor;
    const std::shared_ptr<Poll> m_poll;
};

} // namespace

PollMainLoop::PollMainLoop(const Clock& clock)
    : m_clock(clock)
    , m_wake(eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK))
    , m_poll(std::make_shared<Poll>(m_wake.get())) {}

void PollMainLoop::post(Task task) {
    bool wasAwake = false;
    {
        std::lock_guard lock(m_mutex);
        wasAwake = std::exchange(m_isAwake, true);
        m_posted.push_back(std::move(task));
    }
    if (!wasAwake) eventfd_write(m_wake.get(), 1);
}

std::unique_ptr<Handle> PollMainLoop::startTimer(Milliseconds delay, Milliseconds interval, Task task) {
    auto timer = std::make_shared<Timer>(Timer{m_clock.now() + delay, interval, std::move(task)});
    m_timers.push_back(timer);
    return std::make_unique<EntryHandle<Timer>>(std::move(timer));
}

std::unique_ptr<Handle> PollMainLoop::watchReadable(int descriptor, Task task) {
    auto watch = std::make_shared<Watch>(Watch{descriptor, std::move(task)});
    m_watches.push_back(watch);
    m_poll->add(descriptor);
    return std::make_unique<WatchHandle<Watch, Poll>>(std::move(watch), m_poll);
}

void PollMainLoop::run() {
    while (!m_quit.exchange(false))
        turn(forever);
}

void PollMainLoop::quit() {
    m_quit = true;
    eventfd_write(m_wake.get(), 1);
}

bool PollMainLoop::runUntil(const std::function<bool()>& condition, Milliseconds patience) {
    using std::chrono::steady_clock;
    const auto deadline = steady_clock::now() + patience;
    while (!condition()) {
        const auto left = std::chrono::ceil<Milliseconds>(deadline - steady_clock::now());
        if (left.count() <= 0) return false;
        turn(left);
    }
    return true;
}

bool PollMainLoop::turn(Milliseconds patience) {
    const auto dead = [](const auto& entry) { return !entry->live; };
    std::erase_if(m_timers, dead);
    std::erase_if(m_watches, dead);
    collect(true);
    const bool mayWait = m_ready.empty();
    const bool read = runReadable(mayWait ? patience : Milliseconds::zero());
    if (mayWait) collect(false);
    const bool timed = runTimers();
    return runReady() || timed || read;
}

/// `waits`: before the next look at what is posted, unless there is something now.
void PollMainLoop::collect(bool waits) {
    const std::lock_guard lock(m_mutex);
    if (m_ready.empty()) m_ready.swap(m_posted);
    std::ranges::move(m_posted, std::back_inserter(m_ready));
    m_posted.clear();
    m_isAwake = !waits || !m_ready.empty();
}

std::optional<Clock::Instant> PollMainLoop::nextTimer() const {
    std::optional<Clock::Instant> next;
    for (const auto& timer : m_timers) {
        if (timer->live && (!next || timer->due < *next)) next = timer->due;
    }
    return next;
}

int PollMainLoop::pollTimeout(Milliseconds patience) const {
    auto wait = patience;
    if (const auto next = nextTimer()) {
        const auto left =
            std::max(std::chrono::ceil<Milliseconds>(*next - m_clock.now()), Milliseconds::zero());
        wait = patience == forever ? left : std::min(patience, left);
    }
    return static_cast<int>(std::min<Milliseconds::rep>(wait.count(), INT_MAX));
}

bool PollMainLoop::runReadable(Milliseconds patience) {
    const auto readable = m_poll->wait(pollTimeout(patience));
    bool ran = false;
    if (readable.empty()) return ran;
    const auto watches = m_watches; // callbacks add to the list
    for (const auto& watch : watches) {
        if (!watch->live || !readable.contains(watch->descriptor)) continue;
        watch->task();
        ran = true;
    }
    return ran;
}

bool PollMainLoop::runTimers() {
    if (m_timers.empty()) return false;
    const auto now = m_clock.now();
    std::vector<std::shared_ptr<Timer>> due;
    std::ranges::copy_if(m_timers, std::back_inserter(due),
                         [now](const auto& timer) { return timer->due <= now; });
    std::ranges::stable_sort(due, {}, [](const auto& timer) { return timer->due; });
    bool ran = false;
    for (const auto& timer : due) {
        if (!timer->live) continue;
        if (timer->interval > Milliseconds::zero()) {
            timer->due =
                std::max(timer->due + timer->interval, now + Milliseconds(1)); // beats missed are not made up
        } else {
            timer->live = false;
        }
        timer->task();
        ran = true;
    }
    return ran;
}

bool PollMainLoop::runReady() {
    const bool ran = !m_ready.empty();
    while (!m_ready.empty()) { // a task that turns the loop has the rest run there
        const auto task = std::move(m_ready.front());
        m_ready.pop_front();
        task();
    }
    return ran;
}

} // namespace platform
