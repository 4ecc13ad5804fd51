#pragma once

#include "platform/MainLoop.h"

#include <functional>
#include <memory>

namespace platform {

/// Turns SIGTERM, SIGINT and SIGHUP into a call from the main loop. One per process. After its end the
/// signals do again what they did before.
class TerminationSignals {
public:
    TerminationSignals(MainLoop& mainLoop, std::function<void()> handler);
    ~TerminationSignals();
    TerminationSignals(const TerminationSignals&) = delete;
    TerminationSignals& operator=(const TerminationSignals&) = delete;

private:
    std::unique_ptr<Handle> m_watch;
};

} // namespace platform
