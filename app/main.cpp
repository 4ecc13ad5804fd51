#include "app/SMApplication.h"
#include "app/SMController.h"
#include "app/SMMenuWindowForm.h"
#include "app/SMMenuWindowOwner.h"
#include "app/SMTranslation.h"
#include "lib/base/ExceptionLogging.h"
#include "lib/base/Log.h"
#include "lib/ipc/KXIPCClient.h"
#include "lib/ipc/KXIPCContext.h"
#include "lib/kxAppKit/KXFileTypeIcons.h"
#include "lib/kxAppKit/system/KXWorkspace.h"
#include "platform/linux/FollowingStatusBar.h"
#include "platform/linux/LinuxPorts.h"
#include "platform/linux/NotifierStatusBar.h"
#include "platform/linux/PlistUserDefaults.h"
#include "platform/linux/ProcProcessTable.h"
#include "platform/linux/QtMainLoop.h"
#include "platform/linux/QtModifierKeys.h"
#include "platform/linux/QtWindowServer.h"
#include "platform/linux/StripStatusBar.h"
#include "platform/linux/SystemClock.h"
#include "platform/linux/TerminationSignals.h"
#include "platform/linux/ThemeFileTypeIcons.h"
#include "platform/linux/TrayStatusBar.h"
#include "platform/linux/XcbPanel.h"

#include <cstdlib>
#include <memory>
#include <optional>

namespace {

constexpr const char* programName = "corvane-tesselStartMenu";
constexpr const char* bundleIdentifier = "com.corvane.tesselStartMenu";

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
        m_mainLoop.post([this] {
            m_controller.applicationWillFinishLaunching();
            m_controller.applicationDidFinishLaunching();
        });
    }
    ~Agent() { KXFileTypeIcons::setSource(nullptr); }
    Agent(const Agent&) = delete;
    Agent& operator=(const Agent&) = delete;

private:
    [[noreturn]] void terminate() {
        m_controller.applicationWillTerminate();
        m_ports.reset(); // sends what still waits
        // Returning to main would look better: but nothing that called this, however deep, shall go on.
        std::_Exit(EXIT_SUCCESS);
    }

    platform::SystemClock m_clock;
    platform::QtMainLoop m_mainLoop;
    std::optional<platform::LinuxPorts> m_ports{m_mainLoop};
    platform::ProcProcessTable m_processes{m_mainLoop, m_clock};
    KXIPCContext m_ipc{m_ports->ports(), m_ports->notifications(), m_mainLoop, m_processes, bundleIdentifier};
    KXWorkspace m_workspace{m_processes};
    platform::PlistUserDefaults m_userDefaults;
    platform::QtModifierKeys m_modifierKeys;
    platform::ThemeFileTypeIcons m_fileTypeIcons;
    platform::TrayStatusBar m_tray{m_mainLoop};
    platform::NotifierStatusBar m_notifierBar;
    platform::StripStatusBar m_strip;
    platform::FollowingStatusBar m_statusBar{m_mainLoop, {&m_tray, &m_notifierBar}, m_strip};
    platform::QtWindowServer m_windowServer;
    SMMenuWindowServices m_windowServices{m_windowServer, m_clock, m_mainLoop, m_modifierKeys,
                                          m_userDefaults};
    SMController m_controller{{
        .systemStatusBar = m_statusBar,
        .sharedWorkspace = m_workspace,
        .makeClient = [this] { return std::make_unique<KXIPCClient>(m_ipc); },
        .makeMenuWindow =
            [this](SMMenuWindowOwner& owner) { return SMMakeMenuWindow(owner, m_windowServices); },
        .terminate = [this] { terminate(); },
    }};
    platform::TerminationSignals m_signals{m_mainLoop, [this] { terminate(); }};
    QObject m_connections; ///< ends first, and with it the calls from the application object
};

/// Where hooks of the log would be filled in.
int loggingWillStart() {
    return -1;
}
void loggingDidEnd() {}

} // namespace

int main(int argc, char* argv[]) {
    loggingWillStart();
    SetLogBaseName(programName);
    RotateLogFiles();
    SetExceptionLogging(true);
    LogToolkitMessages();

    // Wherever there is an X server, a Wayland session's too: Wayland itself lets nobody place a panel.
    if (!qEnvironmentVariableIsSet("QT_QPA_PLATFORM") && qEnvironmentVariableIsSet("DISPLAY"))
        qputenv("QT_QPA_PLATFORM", "xcb");
    SMApplication application(argc, argv);
    QCoreApplication::setApplicationName(programName);
    QGuiApplication::setDesktopFileName(bundleIdentifier);
    QGuiApplication::setQuitOnLastWindowClosed(false);
    SMLoadTranslations();
    const Agent agent;
    const int result = QCoreApplication::exec();

    loggingDidEnd();
    return result;
}
