#pragma once

#include "platform/DistributedNotificationCenter.h"
#include "platform/MainLoop.h"
#include "platform/MessagePort.h"
#include "platform/ProcessTable.h"

#include <memory>

namespace platform {

/// What a program without a main loop of its own needs to take part: made first in `main`, on the main
/// thread, and outliving all that is made with it. One per process.
class LinuxSystem {
public:
    LinuxSystem();
    /// Sends what still waits to be sent, for two seconds at most.
    ~LinuxSystem();
    LinuxSystem(const LinuxSystem&) = delete;
    LinuxSystem& operator=(const LinuxSystem&) = delete;

    MainLoop& mainLoop();
    MessagePorts& ports();
    DistributedNotificationCenter& notifications();
    ProcessTable& processes();

    /// Until `quit`, or until the process is asked to end (SIGTERM, SIGINT, SIGHUP). Can be run again.
    void run();
    /// Any thread.
    void quit();

private:
    struct Parts;
    std::unique_ptr<Parts> m_parts;
};

} // namespace platform
