#include "server/AgentKeeper.h"

#include "lib/base/Log.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/kxAppKit/system/KXProcess.h"

#include <algorithm>
#include <chrono>
#include <optional>
#include <string>
#include <utility>

namespace tessel {
namespace {

using namespace std::chrono_literals;
using std::chrono::milliseconds;

constexpr const char* agentBundleIdentifier = "com.corvane.tesselStartMenu";
constexpr milliseconds firstDelay = 250ms;
constexpr milliseconds longestDelay = 60s;
constexpr milliseconds healthyRun = 10s;

} // namespace

milliseconds RestartDelay(milliseconds lastDelay, milliseconds ranFor) {
    if (ranFor >= healthyRun || lastDelay == 0ms) return firstDelay;
    return std::min(lastDelay * 2, longestDelay);
}

AgentKeeper::AgentKeeper(Services services, std::string agentPath)
    : m_services(services)
    , m_path(std::move(agentPath)) {}

AgentKeeper::~AgentKeeper() {
    m_exitWatch.reset();
    if (m_agent) m_services.processes.terminate(*m_agent);
}

void AgentKeeper::run() {
    if (const auto agent = runningAgent())
        watch(*agent);
    else
        start();
}

std::optional<platform::ProcessSerialNumber> AgentKeeper::runningAgent() {
    const auto names = m_services.ports.listeningNames();
    auto processes = KXProcess::processEnumerator(m_services.processes);
    while (const auto process = processes.nextObject())
        if (process->bundleIdentifier() == agentBundleIdentifier &&
            std::ranges::find(names, KX_IPC_PortNameForProcess(process.get())) != names.end())
            return process->processSerialNumber();
    return std::nullopt;
}

void AgentKeeper::start() {
    m_startTime = m_services.clock.now();
    const auto child = m_services.starter.start(m_path);
    m_child = child.value_or(0);
    const auto process = child ? m_services.processes.serialNumberOf(*child) : std::nullopt;
    if (process)
        watch(*process);
    else
        onEnd();
}

void AgentKeeper::watch(platform::ProcessSerialNumber process) {
    m_agent = process;
    m_startTime = m_services.clock.now();
    m_exitWatch = m_services.processes.watchExit(process, [this] { onEnd(); });
    if (!m_exitWatch) onEnd();
}

void AgentKeeper::onEnd() {
    const auto ranFor = std::chrono::duration_cast<milliseconds>(m_services.clock.now() - m_startTime);
    m_lastDelay = RestartDelay(m_lastDelay, ranFor);
    m_agent.reset();
    const int child = std::exchange(m_child, 0);
    const auto fault = child ? m_services.starter.reap(child) : "not our child";
    if (!fault) return Log("The agent has ended, as it was asked to\n");
    Log("The agent has ended (%s); it is started again in %lld ms\n", fault->c_str(),
        static_cast<long long>(m_lastDelay.count()));
    m_restartTimer = m_services.mainLoop.startTimer(m_lastDelay, 0ms, [this] { run(); });
}

} // namespace tessel
