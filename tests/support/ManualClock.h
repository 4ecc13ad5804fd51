#pragma once

#include "platform/Clock.h"

#include <algorithm>
#include <atomic>

/// A clock that goes when told to. Any thread may read it.
class ManualClock final : public platform::Clock {
public:
    Instant now() const override { return m_now; }
    /// Goes there itself.
    void sleepUntil(Instant instant) const override { m_now = std::max(instant, now()); }
    void set(Instant now) { m_now = now; }
    void advance(std::chrono::milliseconds time) { m_now = now() + time; }

private:
    mutable std::atomic<Instant> m_now = Instant(std::chrono::hours(1));
};
