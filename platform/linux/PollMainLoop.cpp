#include "platform/linux/PollMainLoop.h"
#include "platform/Clock.h"
#include "platform/MainLoop.h"

#include <chrono>
#include <cstddef>
#include <functional>
#include <iterator>
#include <memory>
#include <mutex>
#include <optional>
#include <poll.h>
#include <sys/eventfd.h>

#include <algorithm>
#include <climits>
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

} // namespace

PollMainLoop::PollMainLoop(const Clock& clock)
    : m_clock(clock)
    , m_wake(eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)) {}

void PollMainLoop::post(Task task) {
    bool first = false;
    {
        std::lock_guard lock(m_mutex);
        first = m_posted.empty();
        m_posted.push_back(std::move(task));
    }
    if (first) eventfd_write(m_wake.get(), 1);
}

std::unique_ptr<Handle> PollMainLoop::startTimer(Milliseconds delay, Milliseconds interval, Task task) {
    auto timer = std::make_shared<Timer>(Timer{m_clock.now() + delay, interval, std::move(task)});
    m_timers.push_back(timer);
    return std::make_unique<EntryHandle<Timer>>(std::move(timer));
}

std::unique_ptr<Handle> PollMainLoop::watchReadable(int descriptor, Task task) {
    auto watch = std::make_shared<Watch>(Watch{descriptor, std::move(task)});
    m_watches.push_back(watch);
    return std::make_unique<EntryHandle<Watch>>(std::move(watch));
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
    std::vector<Task> tasks;
    {
        std::lock_guard lock(m_mutex);
        tasks.swap(m_posted);
    }
    const bool read = runReadable(tasks.empty() ? patience : Milliseconds::zero());
    if (tasks.empty()) {
        std::lock_guard lock(m_mutex);
        tasks.swap(m_posted);
    }
    const bool timed = runTimers();
    return runPosted(tasks) || timed || read;
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
    const auto watches = m_watches; // callbacks add to the list
    std::vector<pollfd> polled{{m_wake.get(), POLLIN, 0}};
    for (const auto& watch : watches)
        polled.push_back({watch->descriptor, POLLIN, 0});
    if (poll(polled.data(), polled.size(), pollTimeout(patience)) <= 0) return false;

    if (polled[0].revents != 0) {
        eventfd_t ignored = 0;
        eventfd_read(m_wake.get(), &ignored);
    }
    bool ran = false;
    for (std::size_t i = 0; i < watches.size(); ++i) {
        if (polled[i + 1].revents == 0 || !watches[i]->live) continue;
        watches[i]->task();
        ran = true;
    }
    return ran;
}

bool PollMainLoop::runTimers() {
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

bool PollMainLoop::runPosted(std::vector<Task>& tasks) {
    for (auto& task : tasks)
        std::exchange(task, nullptr)();
    return !tasks.empty();
}

} // namespace platform
