#pragma once

#include "platform/Clock.h"
#include "platform/MainLoop.h"
#include "platform/linux/Descriptor.h"

#include <atomic>
#include <deque>
#include <mutex>
#include <optional>
#include <vector>

namespace platform {

/// A main loop of its own, for programs without another one. A turn runs what is readable, then the timers
/// that are due, earliest first, then the tasks that were posted before it. Handles may outlive the loop.
class PollMainLoop final : public MainLoop {
public:
    /// Timers go by `clock`, which must outlive the loop.
    explicit PollMainLoop(const Clock& clock);

    void post(Task task) override;
    std::unique_ptr<Handle> startTimer(Milliseconds delay, Milliseconds interval, Task task) override;
    std::unique_ptr<Handle> watchReadable(int descriptor, Task task) override;

    /// Turns until `quit`. A quit from before counts.
    void run();

    /// Any thread.
    void quit();

    /// Turns until `condition` holds, asking before every turn; false when it does not within `patience`,
    /// which is real time whatever the clock says.
    bool runUntil(const std::function<bool()>& condition, Milliseconds patience);

    /// One turn, waiting no longer than `patience` for something to do. Whether there was something.
    bool turn(Milliseconds patience);

    /// When the next timer is due.
    std::optional<Clock::Instant> nextTimer() const;

private:
    struct Timer;
    struct Watch;
    class Poll;
    static constexpr Milliseconds forever{-1};

    int pollTimeout(Milliseconds patience) const;
    bool runReadable(Milliseconds patience);
    bool runTimers();
    void collect(bool waits);
    bool runReady();

    const Clock& m_clock;
    Descriptor m_wake;
    std::shared_ptr<Poll> m_poll; ///< handles may outlive the loop
    std::vector<std::shared_ptr<Timer>> m_timers;
    std::vector<std::shared_ptr<Watch>> m_watches;
    std::deque<Task> m_ready; ///< posted before the innermost turn under way, which runs them all
    std::mutex m_mutex;
    std::deque<Task> m_posted; ///< guarded by m_mutex
    bool m_isAwake = true;     ///< guarded by m_mutex; will look at what is posted before it waits
    std::atomic<bool> m_quit = false;
};

} // namespace platform
