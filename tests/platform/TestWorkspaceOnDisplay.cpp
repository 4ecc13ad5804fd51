/// On a real X server with a real window manager and a bus, which tools/with-display starts.

#include "lib/kxAppKit/system/KXProcess.h"
#include "lib/kxAppKit/system/KXWorkspace.h"
#include "platform/linux/EwmhDisplay.h"
#include "platform/linux/LinuxWorkspace.h"
#include "platform/linux/PollMainLoop.h"
#include "platform/linux/ProcProcessTable.h"
#include "platform/linux/SystemClock.h"
#include "tests/platform/Child.h"
#include "tests/support/BusService.h"
#include "tests/support/ScratchHome.h"

#include <cstdlib>
#include <gmock/gmock.h>
#include <unistd.h>

using namespace platform;
using testing::ElementsAre;
using namespace std::chrono_literals;

namespace {

/// A process with so many windows one above the other.
struct Windows : Child {
    explicit Windows(int count)
        : Child([count] { show(count); }) {}
    static void show(int count) {
        auto* c = xcb_connect(nullptr, nullptr);
        const auto* screen = xcb_setup_roots_iterator(xcb_get_setup(c)).data;
        for (int i = 0; i < count; ++i) {
            const auto window = xcb_generate_id(c);
            xcb_create_window(c, 0, window, screen->root, 0, 0, 200, 200, 0, XCB_WINDOW_CLASS_INPUT_OUTPUT,
                              screen->root_visual, 0, nullptr);
            xcb_map_window(c, window);
        }
        xcb_flush(c);
    }
};

struct OnDisplay : testing::Test {
    void waitUntil(const char* what, const std::function<bool()>& condition) {
        const auto tick = loop.startTimer(2ms, 2ms, [] {});
        ASSERT_TRUE(loop.runUntil(condition, 30s))
            << "waited in vain: " << what << "; the windows' processes are "
            << testing::PrintToString(stack());
    }
    /// The processes of all windows, from the lowest to the front one.
    static std::vector<std::uint32_t> stack() {
        const EwmhDisplay display;
        return display.processes(display.numbersOfRoot(EwmhDisplay::clientListStacking));
    }
    KXProcess::Pointer process(int pid) {
        return KXProcess::processWithSerialNumber(processes, *processes.serialNumberOf(pid));
    }

    const ScratchHome home;
    SystemClock clock;
    PollMainLoop loop{clock};
    ProcProcessTable processes{loop, clock};
    LinuxWorkspace desktop{processes};
    KXWorkspace workspace{desktop.services()};
    const Workspace& windows = desktop.services().windows;
};

TEST_F(OnDisplay, BringsWindowsToTheFront) {
    auto* c = xcb_connect(nullptr, nullptr);
    const auto gone = xcb_generate_id(c);
    EXPECT_THAT(EwmhDisplay().processes({&gone, 1}), ElementsAre(0u))
        << "though the number is of this process";
    xcb_disconnect(c);
    EXPECT_EQ(windows.bringToFront(getpid(), ProcessWindows::all), status::processHasNoWindow);
    const Windows two(2);
    const auto a = static_cast<std::uint32_t>(two.pid());
    waitUntil("two windows", [&] { return stack() == std::vector{a, a}; });
    const Windows one(1);
    const auto b = static_cast<std::uint32_t>(one.pid());
    waitUntil("a window above", [&] { return stack() == std::vector{a, a, b}; });
    waitUntil("it to be active", [&] { return process(one.pid())->isActiveApplication(windows); });

    EXPECT_FALSE(process(two.pid())->isActiveApplication(windows));
    process(two.pid())->activateForFrontWindow(windows);
    waitUntil("one window in front", [&] { return stack() == std::vector{a, b, a}; });
    waitUntil("it to be active", [&] { return process(two.pid())->isActiveApplication(windows); });
    process(one.pid())->activate(windows);
    waitUntil("the other again", [&] { return stack() == std::vector{a, a, b}; });
    process(two.pid())->activate(windows);
    waitUntil("all windows in front", [&] { return stack() == std::vector{b, a, a}; });
    waitUntil("the front one to be active", [&] { return process(two.pid())->isActiveApplication(windows); });
    EXPECT_EQ(ScratchHome::log(), "");
}

TEST_F(OnDisplay, FollowsTheDesktop) {
    const auto layout = [&] {
        unsigned columns = 0, rows = 0;
        workspace.currentWorkspaceLayoutColumns(columns, rows);
        return std::pair(columns, rows);
    };
    EXPECT_EQ(layout(), std::pair(4u, 1u));
    EXPECT_EQ(workspace.currentWorkspaceNumber(), 1u);
    ASSERT_EQ(std::system("xdotool set_desktop 2"), 0);
    waitUntil("the third desktop", [&] { return workspace.currentWorkspaceNumber() == 3; });
    ASSERT_EQ(std::system("xdotool set_desktop 0"), 0);
    const std::string display = getenv("DISPLAY");
    setenv("DISPLAY", ":nowhere", 1);
    EXPECT_EQ(layout(), std::pair(1u, 1u));
    EXPECT_EQ(workspace.currentWorkspaceNumber(), 1u);
    EXPECT_EQ(KXProcess::activeProcess(processes, windows), nullptr);
    EXPECT_EQ(windows.bringToFront(getpid(), ProcessWindows::all), status::noWindowServer);
    setenv("DISPLAY", display.c_str(), 1);
    const auto folder = home.path() / "Library/Preferences";
    std::filesystem::create_directories(folder);
    std::ofstream(folder / "com.apple.dock.plist")
        << "<plist><dict><key>workspaces</key><true/></dict></plist>";
    EXPECT_EQ(layout(), std::pair(2u, 2u)) << "what the file says and not the desktop";
}

TEST(Session, IsActiveWhenTheLoginManagerSaysSo) {
    const std::string address = getenv("DBUS_SESSION_BUS_ADDRESS");
    const LogindSession session(address);
    EXPECT_FALSE(session.isActive()) << "nobody answers";
    {
        BusService manager("org.freedesktop.login1", "/org/freedesktop/login1/session/auto",
                           "<node><interface name='org.freedesktop.login1.Session'>"
                           "<property name='Active' type='b' access='read'/></interface></node>");
        for (const bool active : {true, false}) {
            manager.property = active;
            EXPECT_EQ(session.isActive(), active);
        }
    }
    EXPECT_FALSE(LogindSession("unix:path=/no/such/bus").isActive());
}

TEST_F(OnDisplay, StartsApplicationsOverTheBus) {
    const std::string entry = home.path() / "org.example.Kx-App.desktop";
    std::ofstream(entry) << "[Desktop Entry]\nType=Application\nName=x\nDBusActivatable=true\nExec=false\n";
    const auto launch = [&](const std::vector<std::string>& urls = {}) {
        return workspace.launchAppWithPath(entry, true, true, nullptr, urls, nullptr);
    };
    EXPECT_EQ(launch(), status::launchFailed) << "nobody has the name";
    BusService application(
        "org.example.Kx-App", "/org/example/Kx_App",
        "<node><interface name='org.freedesktop.Application'>"
        "<method name='Activate'><arg type='a{sv}'/></method>"
        "<method name='Open'><arg type='as'/><arg type='a{sv}'/></method></interface></node>");
    EXPECT_EQ(launch(), 0);
    EXPECT_EQ(launch({"file:///a"}), 0);
    std::optional<LaunchOutcome> late;
    LaunchRequest request;
    request.applicationPath = entry;
    request.flags = launchAsync;
    desktop.services().launching.open(request, [&](const LaunchOutcome& outcome) { late = outcome; });
    EXPECT_FALSE(late);
    while (!late)
        g_main_context_iteration(nullptr, TRUE);
    EXPECT_EQ(late->status, 0);
    EXPECT_THAT(application.calls(),
                ElementsAre("Activate({},)", "Open(['file:///a'], {})", "Activate({},)"));
}

} // namespace
