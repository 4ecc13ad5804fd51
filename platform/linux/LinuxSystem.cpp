#include "platform/linux/LinuxSystem.h"

#include "platform/DistributedNotificationCenter.h"
#include "platform/MainLoop.h"
#include "platform/MessagePort.h"
#include "platform/ProcessTable.h"
#include "platform/linux/LinuxPorts.h"
#include "platform/linux/PollMainLoop.h"
#include "platform/linux/ProcProcessTable.h"
#include "platform/linux/SystemClock.h"
#include "platform/linux/TerminationSignals.h"

#include <memory>

namespace platform {

struct LinuxSystem::Parts {
    SystemClock clock;
    PollMainLoop loop{clock};
    ProcProcessTable processes{loop, clock};
    LinuxPorts ports{loop};
    TerminationSignals signals{loop, [this] { loop.quit(); }};
};

LinuxSystem::LinuxSystem()
    : m_parts(std::make_unique<Parts>()) {}

LinuxSystem::~LinuxSystem() = default;

MainLoop& LinuxSystem::mainLoop() {
    return m_parts->loop;
}

MessagePorts& LinuxSystem::ports() {
    return m_parts->ports.ports();
}

DistributedNotificationCenter& LinuxSystem::notifications() {
    return m_parts->ports.notifications();
}

ProcessTable& LinuxSystem::processes() {
    return m_parts->processes;
}

void LinuxSystem::run() {
    m_parts->loop.run();
}

void LinuxSystem::quit() {
    m_parts->loop.quit();
}

} // namespace platform
