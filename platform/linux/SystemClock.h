#pragma once

#include "platform/Clock.h"

#include <thread>

namespace platform {

class SystemClock final : public Clock {
public:
    Instant now() const override { return std::chrono::steady_clock::now(); }
    void sleepUntil(Instant instant) const override { std::this_thread::sleep_until(instant); }
};

} // namespace platform
