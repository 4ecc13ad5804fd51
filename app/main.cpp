#include "app/SMAgentPort.h"
#include "app/SMApplication.h"
#include "app/SMController.h"
#include "app/SMMenuWindowForm.h"
#include "app/SMMenuWindowOwner.h"
#include "app/SMOptions.h"
#include "app/doctorReport.h"
#include "app/menuPainter.h"
#include "lib/base/ExceptionLogging.h"
#include "lib/base/Log.h"
#include "lib/ipc/KXIPCClient.h"
#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/kxAppKit/KXFileTypeIcons.h"
#include "lib/kxAppKit/system/KXWorkspace.h"
#include "platform/linux/DisplayFindings.h"
#include "platform/linux/FollowingStatusBar.h"
#include "platform/linux/LinuxPorts.h"
#include "platform/linux/LinuxSystem.h"
#include "platform/linux/LinuxWorkspace.h"
#include "platform/linux/NotifierStatusBar.h"
#include "platform/linux/PlaceFindings.h"
#include "platform/linux/PlistUserDefaults.h"
#include "platform/linux/PortNames.h"
#include "platform/linux/PrivateDirectory.h"
#include "platform/linux/ProcProcessTable.h"
#include "platform/linux/QtMainLoop.h"
#include "platform/linux/QtModifierKeys.h"
#include "platform/linux/QtTranslations.h"
#include "platform/linux/QtWindowServer.h"
#include "platform/linux/StripStatusBar.h"
#include "platform/linux/SystemClock.h"
#include "platform/linux/TerminationSignals.h"
#include "platform/linux/ThemeFileTypeIcons.h"
#include "platform/linux/TrayStatusBar.h"
#include "platform/linux/XcbPanel.h"

#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <memory>
#include <optional>
#include <string>

namespace {

constexpr const char* programName = "corvane-tesselStartMenu";
constexpr const char* bundleIdentifier = "com.corvane.tesselStartMenu";

/// Why the program does not do what it was asked to.
int fail(const std::string& reason) {
    std::fprintf(stderr, "%s: %s\n", programName, reason.c_str());
    return EXIT_FAILURE;
}

/// Everything that the agent is made of, each on those before it. Lives inside the application object.
class Agent {
public:
    Agent() {
        KXFileTypeIcons::setSource(&m_fileTypeIcons);
        QObject::connect(qGuiApp, &QGuiApplication::applicationStateChanged, &m_connections,
                         [this](Qt::ApplicationState state) {
                             // News of a panel that was hidden comes late: when it is shown again already,
                             // they are no longer true.
                             if (state != Qt::ApplicationActive && !platform::XcbHasInputFocus())
                                 m_controller.applicationDidResignActive();
                         });
        QObject::connect(qGuiApp, &QGuiApplication::aboutToQuit, &m_connections,
                         [this] { m_controller.applicationWillTerminate(); });
    }
    ~Agent() {
        running = nullptr;
        KXFileTypeIcons::setSource(nullptr);
    }
    Agent(const Agent&) = delete;
    Agent& operator=(const Agent&) = delete;

    /// Whether it runs: not when there is another in this session.
    bool start() {
        m_port.emplace(m_ipc, [this](SMCommand command) { obey(command); });
        if (!m_port->isOurs()) return false;
        RotateLogFiles(); // not before: until now the log may have been another's
        // Before the loop turns, and with it before anybody's command is obeyed.
        m_controller.applicationWillFinishLaunching();
        m_controller.applicationDidFinishLaunching();
        running = this;
        // When the display dies the toolkit exits, from wherever it notices.
        std::atexit([] {
            if (running) running->end();
        });
        return true;
    }

private:
    void obey(SMCommand command) {
        switch (command) {
        case SMCommand::toggle:
            return m_controller.onStatusItemClicked();
        case SMCommand::show:
            return m_controller.openMenuWindow();
        case SMCommand::hide:
            return m_controller.closeMenuWindow();
        case SMCommand::quit:
            terminate();
        default:
            return;
        }
    }

    void end() {
        m_controller.applicationWillTerminate();
        m_port.reset();
        m_ports.reset(); // sends what still waits
    }

    [[noreturn]] void terminate() {
        end();
        // Returning to main would look better: but nothing that called this, however deep, shall go on.
        std::_Exit(EXIT_SUCCESS);
    }

    static inline Agent* running =
        nullptr; // NOLINT(*-avoid-non-const-global-variables): what exits knows no object

    platform::SystemClock m_clock;
    platform::QtMainLoop m_mainLoop;
    std::optional<platform::LinuxPorts> m_ports{m_mainLoop};
    platform::ProcProcessTable m_processes{m_mainLoop, m_clock};
    KXIPCContext m_ipc{m_ports->ports(), m_ports->notifications(), m_mainLoop, m_processes, bundleIdentifier};
    std::optional<SMAgentPort> m_port;
    platform::LinuxWorkspace m_desktop{m_processes};
    KXWorkspace m_workspace{m_desktop.services()};
    platform::PlistUserDefaults m_userDefaults;
    platform::QtModifierKeys m_modifierKeys;
    platform::ThemeFileTypeIcons m_fileTypeIcons;
    platform::TrayStatusBar m_tray{m_mainLoop};
    platform::NotifierStatusBar m_notifierBar;
    platform::StripStatusBar m_strip;
    platform::FollowingStatusBar m_statusBar{m_mainLoop, {&m_tray, &m_notifierBar}, m_strip};
    platform::QtWindowServer m_windowServer;
    SMMenuWindowMaker m_windowMaker{{m_windowServer, m_clock, m_mainLoop, m_modifierKeys, m_userDefaults}};
    SMController m_controller{{
        .systemStatusBar = m_statusBar,
        .sharedWorkspace = m_workspace,
        .makeClient = [this] { return std::make_unique<KXIPCClient>(m_ipc); },
        .prepareMenuWindow = [this](SMMenuWindowOwner& owner) { m_windowMaker.prepare(owner); },
        .makeMenuWindow = [this](SMMenuWindowOwner& owner) { return m_windowMaker.make(owner); },
        .holdTyping = [] { return platform::XcbHoldTyping(); },
        .terminate = [this] { terminate(); },
        .mainLoop = m_mainLoop,
        .prepareFonts = MenuPainter::prepareFonts,
    }};
    platform::TerminationSignals m_signals{m_mainLoop, [this] { terminate(); }};
    QObject m_connections; ///< ends first, and with it the calls from the application object
};

/// Where hooks of the log would be filled in.
int loggingWillStart() {
    return -1;
}
void loggingDidEnd() {}

bool isListening(const char* portName) {
    return platform::PortNames(platform::DefaultPortDirectory()).isListening(portName);
}

/// With an X server wherever there is one, a Wayland session's too: Wayland itself lets nobody place a panel.
void chooseDisplay() {
    if (!qEnvironmentVariableIsSet("QT_QPA_PLATFORM")) qputenv("QT_QPA_PLATFORM", "xcb");
}

/// Without one the toolkit would end the process by a signal.
bool hasDisplay() {
    return qEnvironmentVariable("QT_QPA_PLATFORM") != QLatin1String("xcb") || platform::DisplayAnswers();
}

int run(int argc, char* argv[]) {
    constexpr const char* another = "the start menu runs already in this session";
    const std::string directory = platform::DefaultPortDirectory();
    if (!platform::OpenPrivateDirectory(AT_FDCWD, directory)) return fail(directory + " cannot be used");
    if (isListening(SMAgentPortName)) return fail(another);
    chooseDisplay();
    if (!hasDisplay()) {
        Log("Cannot run: there is no display\n");
        return fail("there is no display");
    }
    SetExceptionLogging(true);
    LogToolkitMessages();
    SMApplication application(argc, argv);
    QCoreApplication::setApplicationName(programName);
    QGuiApplication::setDesktopFileName(bundleIdentifier);
    QGuiApplication::setQuitOnLastWindowClosed(false);
    platform::LoadTranslations(QStringLiteral("tesselStartMenu"));
    Agent agent;
    return agent.start() ? QCoreApplication::exec() : fail(another);
}

int tell(SMCommand command) {
    platform::LinuxSystem system;
    KXIPCContext context{system.ports(), system.notifications(), system.mainLoop(), system.processes(),
                         bundleIdentifier};
    const auto outcome = SMTellAgent(context, command);
    return outcome.exitCode == EXIT_SUCCESS ? EXIT_SUCCESS : fail(outcome.reason);
}

int examine(int argc, char* argv[]) {
    chooseDisplay();
    std::optional<SMApplication> application;
    if (hasDisplay()) application.emplace(argc, argv);
    SMFindings findings;
    findings.display = platform::LookAtDisplay();
    findings.hasRuntimeVariable = qEnvironmentVariableIsSet("XDG_RUNTIME_DIR");
    findings.portDirectory.path = platform::DefaultPortDirectory();
    findings.portDirectory.fault = platform::PrivateDirectoryFault(findings.portDirectory.path);
    findings.log = platform::LookForWriting(LogFilePath(0));
    findings.library = platform::LookForWriting(qEnvironmentVariable("HOME").toStdString() + "/Library");
    findings.processFault = platform::ProcessWatchFault();
    if (findings.portDirectory.fault.empty()) {
        findings.agentRuns = isListening(SMAgentPortName);
        findings.serverRuns = isListening(KX_IPC_ServerPortName().c_str());
    }
    const auto report = SMReportOf(findings);
    std::fputs(report.text.c_str(), stdout);
    return report.isHealthy ? EXIT_SUCCESS : EXIT_FAILURE;
}

} // namespace

int main(int argc, char* argv[]) {
    loggingWillStart();
    SetLogBaseName(programName);
    std::string error;
    const auto command = SMParseArguments({argv + 1, argv + argc}, error);
    if (!command) {
        fail(error + " (try --help)");
        return 2;
    }
    int result = EXIT_SUCCESS;
    switch (*command) {
    case SMCommand::run:
        result = run(argc, argv);
        break;
    case SMCommand::doctor:
        result = examine(argc, argv);
        break;
    case SMCommand::help:
        std::fputs(std::string(SMHelpText).c_str(), stdout);
        break;
    case SMCommand::version:
        std::printf("%s %s\n", programName, KX_VERSION);
        break;
    default:
        result = tell(*command);
    }
    loggingDidEnd();
    return result;
}
