#pragma once

#include "lib/base/SharedBytes.h"
#include "platform/MainLoop.h"

#include <cstdint>
#include <memory>
#include <string>

/// Looking at what passes a port, from another process of the same user.
namespace platform {

/// A copy of a message that the watched process got or sent.
struct PassingMessage {
    bool outgoing = false;
    int processID = 0; ///< the one at the other end
    bool synchronous = false;
    std::uint64_t missed = 0; ///< messages before this one of which no copy came: the watch was too slow
    SharedBytes bytes;
};

/// Called on the main thread, from the main loop.
class PortWatchDelegate {
public:
    /// Once, first: how the port is doing, a property list with a dictionary of numbers.
    virtual void onStatistics(const SharedBytes& propertyList) = 0;
    virtual void onMessage(const PassingMessage& message) = 0;
    /// The process has closed the port, or ended. Nothing follows.
    virtual void onEnd() = 0;

protected:
    ~PortWatchDelegate() = default;
};

/// Main thread only.
class PortWatches {
public:
    virtual ~PortWatches() = default;

    /// Watches until the handle ends; the delegate must outlive it. The watched process never waits for the
    /// watch. Null when nobody listens on that name.
    [[nodiscard]] virtual std::unique_ptr<Handle> watch(const std::string& name,
                                                        PortWatchDelegate& delegate) = 0;
};

} // namespace platform
