#include "lib/base/ExceptionLogging.h"
#include "lib/base/Log.h"
#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCNames.h"
#include "platform/LaunchServices.h"
#include "platform/linux/GioLaunchServices.h"
#include "platform/linux/LinuxPorts.h"
#include "platform/linux/PrivateDirectory.h"
#include "platform/linux/ProcProcessTable.h"
#include "platform/linux/QtMainLoop.h"
#include "platform/linux/QtTranslations.h"
#include "platform/linux/SystemClock.h"
#include "platform/linux/TerminationSignals.h"
#include "server/AgentKeeper.h"
#include "server/Options.h"
#include "server/StartMenuServer.h"
#include "server/Texts.h"
#include "server/Worker.h"
#include "server/catalogues/Machine.h"
#include "server/catalogues/SampleMachine.h"
#include "server/linux/BusLoss.h"
#include "server/linux/HostMachine.h"
#include "server/linux/SpawnedPrograms.h"

#include <QGuiApplication>
#include <QtGlobal>
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace tessel {
namespace {

constexpr const char* programName = "tesselDaemon";
constexpr const char* bundleIdentifier = "com.corvane.tesselDaemon";
constexpr const char* agentName = "corvane-tesselStartMenu";

/// The machines that there are without a configuration.
std::vector<std::unique_ptr<Machine>> MakeMachines(const std::string& prefix,
                                                   platform::LaunchServices& launching) {
    std::vector<std::unique_ptr<Machine>> machines;
    machines.push_back(std::make_unique<HostMachine>(
        "host", Localized(QT_TRANSLATE_NOOP("tesselDaemon", "This computer")), launching));
    if (auto sample = SampleMachine::open("sample", prefix + "/share/corvane-tessel/sample"))
        machines.push_back(std::move(sample));
    return machines;
}

/// The index of the machine that is to be shown first; nothing when there is none of that name or place.
std::optional<std::size_t> SelectedMachine(const Options& options,
                                           const std::vector<std::unique_ptr<Machine>>& machines) {
    std::size_t index = options.select.value_or(0);
    if (options.machine) {
        const auto isNamed = [&](const auto& machine) {
            return machine->id() == *options.machine || machine->name() == *options.machine;
        };
        index = static_cast<std::size_t>(std::ranges::find_if(machines, isNamed) - machines.begin());
    }
    if (index < machines.size()) return index;
    return std::nullopt;
}

void Say(const std::string& reason) {
    std::fprintf(stderr, "%s: %s\n", programName, reason.c_str());
}

/// Everything that the daemon is made of, each on those before it. Lives inside the application object.
class Daemon {
public:
    explicit Daemon(const Options& options)
        : m_prefix(std::filesystem::path(QCoreApplication::applicationDirPath().toStdString()).parent_path())
        , m_options(options) {}

    /// Whether it runs; when not, why not was said.
    bool start() {
        m_server.setAllowIncomingMessages(true);
        if (!m_server.isReachable())
            return fail(m_ports->ports().isListening(KX_IPC_ServerPortName())
                            ? "another daemon serves already"
                            : "cannot open a port");
        // Not before: until now the log may have been another daemon's.
        RotateLogFiles();
        if (!m_options.record.empty() && !m_record.open(m_options.record))
            return fail("cannot write the record");
        m_machines = MakeMachines(m_prefix, m_launching);
        const auto selected = SelectedMachine(m_options, m_machines);
        if (!selected) return fail("there is no such machine");
        m_service.emplace(
            m_server, m_machines, [this](Job job) { m_worker.run(std::move(job)); }, m_record,
            StartMenuServer::Options{.selected = *selected, .showWhenConnected = m_options.show});
        if (!m_options.startAgent) return true;
        m_agent.emplace(AgentKeeper::Services{m_programs, m_processes, m_ports->ports(), m_mainLoop, m_clock},
                        m_prefix + "/bin/" + agentName);
        m_agent->run();
        return true;
    }

private:
    static bool fail(const char* reason) {
        Log("Cannot run: %s\n", reason);
        Say(reason);
        return false;
    }

    void terminate() {
        m_agent.reset();
        m_server.terminateWithDelegate([] { QCoreApplication::quit(); });
    }

    const std::string m_prefix;
    const Options m_options;
    Record m_record;
    platform::SystemClock m_clock;
    platform::QtMainLoop m_mainLoop;
    std::optional<platform::LinuxPorts> m_ports{m_mainLoop};
    platform::ProcProcessTable m_processes{m_mainLoop, m_clock};
    KXIPCContext m_ipc{m_ports->ports(), m_ports->notifications(), m_mainLoop, m_processes, bundleIdentifier};
    platform::GioLaunchServices m_launching;
    std::vector<std::unique_ptr<Machine>> m_machines;
    Worker m_worker{m_mainLoop};
    SpawnedPrograms m_programs;
    KXIPCServer m_server{m_ipc};
    std::optional<StartMenuServer> m_service;
    std::optional<AgentKeeper> m_agent;
    platform::TerminationSignals m_signals{m_mainLoop, [this] { terminate(); }};
};

int Run(const Options& options) {
    SetLogBaseName(programName);
    SetExceptionLogging(true);
    const std::string directory = platform::DefaultPortDirectory();
    if (!platform::OpenPrivateDirectory(AT_FDCWD, directory)) { // which has said why in the log
        Say(directory + " cannot be used");
        return EXIT_FAILURE;
    }
    SurviveBusLoss();
    // Icons need the toolkit, windows there are none. The environment would say so to every program that we
    // start.
    char name[] = "tesselDaemon", option[] = "-platform", platform[] = "offscreen";
    char* arguments[] = {name, option, platform, nullptr};
    int count = 3;
    const QGuiApplication application(count, arguments);
    platform::LoadTranslations(QStringLiteral("tesselDaemon"));
    Daemon daemon(options);
    return daemon.start() ? QCoreApplication::exec() : EXIT_FAILURE;
}

} // namespace
} // namespace tessel

int main(int argc, char* argv[]) {
    std::string error;
    const auto options = tessel::ParseOptions({argv + 1, argv + argc}, error);
    if (!options) {
        tessel::Say(error + " (try --help)");
        return 2;
    }
    if (options->help || options->version) {
        const std::string version = std::string(tessel::programName) + " " + KX_VERSION + "\n";
        std::fputs(options->help ? std::string(tessel::helpText).c_str() : version.c_str(), stdout);
        return EXIT_SUCCESS;
    }
    return tessel::Run(*options);
}
