#pragma once

#include "platform/Clock.h"
#include "platform/MessagePort.h"
#include "platform/ProcessTable.h"

#include <memory>
#include <optional>
#include <string>

namespace tessel {

/// Starting programs. Main thread only.
class ProgramStarter {
public:
    virtual ~ProgramStarter() = default;
    /// The id of the new process; nothing, and logged, when it cannot be started.
    virtual std::optional<int> start(const std::string& path) = 0;
    /// Lets go of a process that we started and that has ended; how it ended, for people, and nothing when it
    /// ended well.
    virtual std::optional<std::string> reap(int pid) = 0;
};

/// How long to wait before the agent is started again: longer each time that it ends soon after its start.
std::chrono::milliseconds RestartDelay(std::chrono::milliseconds lastDelay, std::chrono::milliseconds ranFor);

/// Sees to it that the agent runs, until it ends well, which it does when the user asks it to. One that is
/// there already, left by a daemon that was killed, is kept: it must have a port of its own in this session.
/// Main thread only.
class AgentKeeper {
public:
    struct Services {
        ProgramStarter& starter;
        platform::ProcessTable& processes;
        platform::MessagePorts& ports;
        platform::MainLoop& mainLoop;
        const platform::Clock& clock;
    };

    AgentKeeper(Services services, std::string agentPath);
    /// The agent is asked to end with us.
    ~AgentKeeper();
    AgentKeeper(const AgentKeeper&) = delete;
    AgentKeeper& operator=(const AgentKeeper&) = delete;

    void run();

private:
    std::optional<platform::ProcessSerialNumber> runningAgent();
    void start();
    void watch(platform::ProcessSerialNumber process);
    void onEnd();

    Services m_services;
    std::string m_path;
    std::optional<platform::ProcessSerialNumber> m_agent;
    int m_child = 0; ///< to be reaped; 0 when the agent is not our child
    platform::Clock::Instant m_startTime;
    std::chrono::milliseconds m_lastDelay{0};
    std::unique_ptr<platform::Handle> m_exitWatch;
    std::unique_ptr<platform::Handle> m_restartTimer;
};

} // namespace tessel
