#include "lib/kxAppKit/system/KXAppleEvent.h"
#include "lib/kxAppKit/system/KXProcess.h"
#include "lib/kxAppKit/system/KXWorkspace.h"
#include "tests/support/InMemoryDesktop.h"
#include "tests/support/InMemoryProcessTable.h"
#include "tests/support/ScratchHome.h"

#include <gmock/gmock.h>

using namespace platform;
using testing::ElementsAre;
using testing::EndsWith;

namespace {

struct Workspace : testing::Test {
    InMemoryProcessTable processes;
    InMemoryDesktop desktop;
    KXWorkspace workspace{desktop.services(processes)};
    const ScratchHome home;
};

TEST_F(Workspace, LogsWhyAProcessDoesNotComeToTheFront) {
    const auto process = KXProcess::processWithSerialNumber(processes, processes.start(2000));
    desktop.windows.error = status::processHasNoWindow;
    process->activate(desktop.windows);
    EXPECT_THAT(ScratchHome::log(), EndsWith(": -[KXProcess activate], Error: -606\n"));
    processes.kill(process->processSerialNumber());
    process->activateForFrontWindow(desktop.windows);
    EXPECT_THAT(ScratchHome::log(), EndsWith(": -[KXProcess activateForFrontWindow], Error: -600\n"));
}

TEST_F(Workspace, LaunchesWithFlagsDocumentsAndProperties) {
    processes.start(2000, "com.example.guest");
    const std::string path = "/usr/share/applications/com.example.guest.desktop";
    const KXAppleEvent properties(plist::Dictionary{{"machine", "one"}});
    const KXAppleEvent unwritable(plist::Dictionary{{"all", plist::Array{nullptr}}});
    desktop.launching.outcome.applicationPath = path;
    KXProcess::Pointer process;
    EXPECT_EQ(workspace.launchAppWithPath(path, true, true, &properties, {"file:///a"}, &process), 0);
    EXPECT_EQ(process->pid(), 2000) << "found by its URL";
    processes.start(3000, "com.example.guest");
    desktop.launching.outcome.pid = 3000;
    EXPECT_EQ(workspace.launchAppWithPath(path, false, false, &unwritable, {}, &process), 0);
    EXPECT_EQ(process->pid(), 3000) << "the new one";
    desktop.launching.outcome.status = status::fileNotFound;
    EXPECT_EQ(workspace.launchAppWithPath(path, true, false, nullptr, {}, &process), -43);
    EXPECT_EQ(process, nullptr);
    EXPECT_EQ(workspace.launchAppWithPath("", true, true, nullptr, {}, nullptr), -50);
    EXPECT_EQ(workspace.launchAppWithPath({"/a\0b", 4}, true, true, nullptr, {}, nullptr), -37);

    const auto& requests = desktop.launching.requests;
    ASSERT_EQ(requests.size(), 3u);
    EXPECT_THAT(requests[0].documentURLs, ElementsAre("file:///a"));
    EXPECT_EQ(KXAppleEvent::ofEventRecord(requests[0].properties)->properties(), properties.properties());
    EXPECT_EQ(requests[1].properties, "") << "a record that cannot be copied is left out";
    EXPECT_THAT((std::vector{requests[0].flags, requests[1].flags, requests[2].flags}),
                ElementsAre(0u, 0x10200u, 0x10000u));
    for (const char* junk : {"", "?", "YnBsaXN0MDA="})
        EXPECT_FALSE(KXAppleEvent::ofEventRecord(junk)) << junk;
}

TEST_F(Workspace, CountsDesktopsAndSessions) {
    desktop.windows.error = -4;
    EXPECT_EQ(workspace.currentWorkspaceNumber(), 1u);
    EXPECT_THAT(ScratchHome::log(),
                EndsWith(": -[NSWorkspace(KXAppKitAdditions) currentWorkspaceNumber]: Couldn't get current "
                         "workspace, error -4.\n"));
    const auto layout = [this](std::map<std::string, int> values) {
        desktop.dock.values = std::move(values);
        unsigned columns = 0, rows = 0;
        workspace.currentWorkspaceLayoutColumns(columns, rows);
        return std::pair(columns, rows);
    };
    EXPECT_EQ(layout({}), std::pair(1u, 1u));
    EXPECT_EQ(layout({{"workspaces", 0}, {"workspaces-cols", 3}, {"workspaces-rows", 4}}), std::pair(1u, 1u));
    EXPECT_EQ(layout({{"workspaces", 1}}), std::pair(2u, 2u));
    EXPECT_EQ(layout({{"workspaces", 1}, {"workspaces-cols", 0}, {"workspaces-rows", 1}}), std::pair(2u, 1u));
    for (const auto active : {std::optional(true), std::optional(false), std::optional<bool>()}) {
        desktop.session.active = active;
        EXPECT_EQ(workspace.currentUserSessionIsActive(), active == true);
    }
    workspace.openSystemPreferencesPane("sound");
    desktop.launching.settingsFailure = "it is gone";
    workspace.openSystemPreferencesPane("sound");
    EXPECT_THAT(ScratchHome::log(),
                testing::MatchesRegex("[^\n]*\n[^\n]*: -\\[NSWorkspace\\(KXAppKitAdditions\\) "
                                      "openSystemPreferencesPane:\\], executing apple script failed. Error "
                                      "Info: it is gone\n"));
}

} // namespace
