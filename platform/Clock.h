#pragma once

#include <chrono>

namespace platform {

/// The time, handed in so that tests can tell it. Any thread.
class Clock {
public:
    using Instant = std::chrono::steady_clock::time_point;
    virtual ~Clock() = default;
    /// Monotonic.
    virtual Instant now() const = 0;
    /// Blocks the thread until then; returns at once when that has passed.
    virtual void sleepUntil(Instant instant) const = 0;
};

} // namespace platform
