#pragma once

#include "platform/PortWatch.h"
#include "platform/linux/PortNames.h"

namespace platform {

/// Watches on ports over Unix sockets in a directory of the user's.
class UnixPortWatches final : public PortWatches {
public:
    /// The loop must outlive it, and every handle.
    UnixPortWatches(MainLoop& mainLoop, const std::string& directory)
        : m_mainLoop(mainLoop)
        , m_names(directory) {}

    std::unique_ptr<Handle> watch(const std::string& name, PortWatchDelegate& delegate) override;

private:
    MainLoop& m_mainLoop;
    const PortNames m_names;
};

} // namespace platform
