#pragma once

#include "platform/linux/InotifyNotificationCenter.h"
#include "platform/linux/PrivateDirectory.h"
#include "platform/linux/SystemClock.h"
#include "platform/linux/UnixMessagePorts.h"

namespace platform {

/// Ports and notices for a program's `main`. The loop must outlive them, and they what is made with them.
class LinuxPorts {
public:
    explicit LinuxPorts(MainLoop& mainLoop, const std::string& directory = DefaultPortDirectory())
        : m_ports(mainLoop, m_clock, directory)
        , m_notifications(mainLoop, directory) {}

    MessagePorts& ports() { return m_ports; }
    DistributedNotificationCenter& notifications() { return m_notifications; }

private:
    SystemClock m_clock;
    UnixMessagePorts m_ports;
    InotifyNotificationCenter m_notifications;
};

} // namespace platform
