#pragma once

#include "platform/linux/PollMainLoop.h"
#include "tests/support/ManualClock.h"

/// A main loop that runs when told to, with timers in virtual time. Posts from other threads and descriptors
/// are real.
class ManualMainLoop final : public platform::MainLoop {
public:
    const platform::Clock& clock() const { return m_clock; }

    void post(Task task) override { m_loop.post(std::move(task)); }
    std::unique_ptr<platform::Handle> startTimer(Milliseconds delay, Milliseconds interval,
                                                 Task task) override {
        return m_loop.startTimer(delay, interval, std::move(task));
    }
    std::unique_ptr<platform::Handle> watchReadable(int descriptor, Task task) override {
        return m_loop.watchReadable(descriptor, std::move(task));
    }

    /// Runs what is to be run now, and what follows from it.
    void runPending() {
        while (m_loop.turn(Milliseconds::zero())) {
        }
    }

    /// Lets virtual time pass, running every timer at its own moment.
    void advance(Milliseconds time) {
        const auto end = m_clock.now() + time;
        runPending();
        for (auto next = m_loop.nextTimer(); next && *next <= end; next = m_loop.nextTimer()) {
            m_clock.set(*next);
            runPending();
        }
        m_clock.set(end);
    }

    /// Runs until `condition` holds, for what other threads and processes do; false when it does not in
    /// (real) time.
    bool runUntil(const std::function<bool()>& condition, Milliseconds patience = std::chrono::seconds(20)) {
        return m_loop.runUntil(condition, patience);
    }

private:
    ManualClock m_clock;
    platform::PollMainLoop m_loop{m_clock};
};
