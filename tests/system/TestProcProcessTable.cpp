#include "platform/linux/PollMainLoop.h"
#include "platform/linux/ProcProcessTable.h"
#include "platform/linux/SystemClock.h"
#include "tests/platform/Child.h"
#include "tests/support/ManualClock.h"
#include "tests/support/ScratchHome.h"

#include <algorithm>
#include <gtest/gtest.h>
#include <sys/stat.h>

using namespace std::chrono_literals;
namespace fs = std::filesystem;

namespace {

const platform::SystemClock systemClock;

struct ProcProcessTable : testing::Test {
    bool walkFinds(int pid) const {
        std::vector<std::uint32_t> pids;
        for (auto next = table.nextProcess({}); next; next = table.nextProcess(next->serialNumber))
            pids.push_back(next->serialNumber.lowLongOfPSN);
        EXPECT_TRUE(std::ranges::is_sorted(pids));
        return std::ranges::find(pids, static_cast<std::uint32_t>(pid)) != pids.end();
    }

    platform::PollMainLoop loop{systemClock};
    platform::ProcProcessTable table{loop, systemClock};
};

TEST_F(ProcProcessTable, KnowsAProcessByIdAndStartUntilItIsAZombie) {
    const auto current = table.currentProcess();
    ASSERT_EQ(current, table.serialNumberOf(getpid()));
    EXPECT_EQ(table.info(*current)->executablePath, fs::read_symlink("/proc/self/exe"));

    const Child child;
    const auto process = table.serialNumberOf(child.pid());
    ASSERT_TRUE(process && table.info(*process) && walkFinds(child.pid()));
    EXPECT_TRUE(table.terminate(*process)) << "which does not reach a child that stands still";
    EXPECT_TRUE(table.kill(*process));
    siginfo_t info;
    waitid(P_PID, static_cast<id_t>(child.pid()), &info, WEXITED | WNOWAIT);
    EXPECT_FALSE(walkFinds(child.pid()));
    EXPECT_FALSE(table.serialNumberOf(child.pid()));
    const platform::ProcessSerialNumber reused{current->highLongOfPSN + 1, current->lowLongOfPSN};
    for (const auto ended : {*process, reused, platform::ProcessSerialNumber{}}) {
        EXPECT_FALSE(table.info(ended));
        EXPECT_FALSE(table.watchExit(ended, [] {}));
        EXPECT_FALSE(table.terminate(ended) || table.kill(ended));
    }
}

TEST_F(ProcProcessTable, CallsOnceWhenAProcessEnds) {
    const Child child, survivor;
    int calls = 0;
    const auto process = *table.serialNumberOf(child.pid());
    std::unique_ptr<platform::Handle> watch, letGo;
    watch = table.watchExit(process, [&] {
        ++calls;
        watch.reset();
    });
    const auto kept = table.watchExit(process, [&] { ++calls; });
    letGo = table.watchExit(process, [] { ADD_FAILURE(); });
    const auto living = table.watchExit(*table.serialNumberOf(survivor.pid()), [] { ADD_FAILURE(); });
    letGo.reset();
    ::kill(child.pid(), SIGKILL);
    EXPECT_TRUE(loop.runUntil([&] { return calls == 2; }, 30s));
    EXPECT_FALSE(loop.turn(0ms));
}

/// A /proc, a prefix and data directories of the test's own.
struct ApplicationOfProcess : testing::Test {
    std::string path(const std::string& name) const { return root.path() / name; }

    void write(const std::string& name, const std::string& text) const {
        fs::create_directories(fs::path(path(name)).parent_path());
        std::ofstream(path(name)) << text;
    }
    void writeEntry(const std::string& name, const std::string& keys) const {
        write(name, "[Desktop Entry]\nType=Application\n" + keys + "\n");
    }
    void setExecutable(int pid, const std::string& executable) const {
        const auto link = path("proc/" + std::to_string(pid) + "/exe");
        fs::remove(link);
        fs::create_symlink(path(executable), link);
    }
    void start(int pid, const std::string& executable, int parent = 1, const std::string& unit = "") const {
        write("proc/" + std::to_string(pid) + "/stat", std::to_string(pid) + " (x) S " +
                                                           std::to_string(parent) +
                                                           " 0 0 0 0 0 0 0 0 0 0 0 0 0 20 0 1 0 77 0\n");
        write("proc/" + std::to_string(pid) + "/cgroup", "0::/" + unit + "\n");
        write(executable, "");
        setExecutable(pid, executable);
    }
    std::optional<platform::ProcessInfo> info(int pid) {
        return table.info({77, static_cast<std::uint32_t>(pid)});
    }
    std::optional<std::string> idOf(int pid) { return info(pid).value().bundleIdentifier; }

    ScratchHome root;
    ManualClock clock;
    platform::PollMainLoop loop{systemClock};
    const bool hasProc = fs::create_directory(path("proc"));
    platform::ProcProcessTable table{
        loop, clock, {path("proc"), {path("home"), path("data")}, {path("nowhere"), path("usr/bin")}}};
};

TEST_F(ApplicationOfProcess, IsTheEntryOfItsPrefixBeforeAnyOther) {
    start(10, "opt/x/bin/edit");
    start(11, "opt/x/lib/real");
    start(12, "opt/x/bin/tool");
    fs::create_symlink(path("opt/x/lib/real"), path("opt/x/bin/link"));
    EXPECT_TRUE(info(10)->isBackgroundOnly);
    EXPECT_FALSE(idOf(10));

    writeEntry("home/applications/other.desktop", "Exec=" + path("opt/x/bin/edit"));
    clock.advance(100ms);
    EXPECT_EQ(idOf(10), "other");
    writeEntry("opt/x/share/applications/a.hidden.desktop", "Exec=edit --handle %u\nNoDisplay=true");
    writeEntry("opt/x/share/applications/org.example.Edit.desktop", "Exec=edit %F");
    writeEntry("opt/x/share/applications/org.example.Link.desktop", "Exec=link\nNoDisplay=true");
    clock.advance(100ms);
    EXPECT_EQ(idOf(10), "org.example.Edit");
    EXPECT_EQ(info(10)->bundlePath, path("opt/x/share/applications/org.example.Edit.desktop"));
    EXPECT_FALSE(info(10)->isUIElement);
    EXPECT_FALSE(info(10)->isBackgroundOnly);
    EXPECT_EQ(idOf(11), "org.example.Link");
    EXPECT_TRUE(info(11)->isUIElement);
    EXPECT_FALSE(idOf(12));
    setExecutable(10, "opt/x/bin/edit (deleted)");
    EXPECT_EQ(idOf(10), "org.example.Edit") << "a program that was upgraded";
}

TEST_F(ApplicationOfProcess, IsWhatItsSandboxSays) {
    start(10, "usr/bin/edit");
    writeEntry("usr/share/applications/edit.desktop", "Exec=edit");
    writeEntry("data/applications/org.example.Boxed.desktop", "Exec=flatpak run x\nNoDisplay=true");
    write("proc/10/root/.flatpak-info", "[Application]\nname=org.example.Boxed\n[Instance]\nname=x\n");
    EXPECT_EQ(idOf(10), "org.example.Boxed");
    EXPECT_EQ(info(10)->bundlePath, path("data/applications/org.example.Boxed.desktop"));
    EXPECT_TRUE(info(10)->isUIElement);
    write("proc/10/root/.flatpak-info", "[Application]\nname=../x\n");
    EXPECT_EQ(idOf(10), "edit");
    fs::remove(path("proc/10/root/.flatpak-info"));
    ASSERT_EQ(mkfifo(path("proc/10/root/.flatpak-info").c_str(), 0600), 0);
    EXPECT_EQ(idOf(10), "edit");
}

TEST_F(ApplicationOfProcess, IsItsUnitForTheUnitsTopProcessAlone) {
    const std::string unit = "app.slice/app-gnome-org.example.Terminal-7.scope";
    writeEntry("data/applications/shell.desktop", "Exec=lua");
    start(1, "usr/bin/init");
    start(10, "usr/lib/terminal/server", 1, unit);
    start(11, "usr/bin/lua", 10, unit);
    EXPECT_EQ(idOf(10), "org.example.Terminal");
    EXPECT_FALSE(info(10)->bundlePath);
    EXPECT_EQ(idOf(11), "shell");
}

TEST_F(ApplicationOfProcess, IsLookedAtAgainUntilItHasRunOneProgramForTenSeconds) {
    const auto idInWalk = [&] { return table.nextProcess({}).value().bundleIdentifier; };
    start(10, "usr/bin/edit");
    for (const std::string program : {"edit", "draw", "play"}) {
        writeEntry("data/applications/" + program + ".desktop", "Exec=" + program);
        write("usr/bin/" + program, "");
    }
    write("proc/uptime", "10.77 0\n");
    EXPECT_EQ(idInWalk(), "edit");
    setExecutable(10, "usr/bin/draw");
    EXPECT_EQ(idInWalk(), "draw");
    write("proc/uptime", "10.78 0\n");
    EXPECT_EQ(idInWalk(), "draw");
    start(10, "usr/bin/draw", 1, "app-play.service");
    fs::remove(path("data/applications/draw.desktop"));
    clock.advance(100ms);
    EXPECT_FALSE(idInWalk()) << "known, and not read again; but the entries are looked up each time";
    setExecutable(10, "usr/bin/play");
    EXPECT_EQ(idInWalk(), "play") << "it has executed another program";
}

TEST_F(ApplicationOfProcess, FollowsTheEntriesThatComeAndGo) {
    const auto entry = "data/applications/org.example.Edit.desktop";
    const auto now = fs::file_time_type::clock::now();
    const auto folder = path("data/applications");
    start(10, "usr/bin/edit");
    writeEntry(entry, "Exec=edit");
    fs::last_write_time(folder, now - 20s);
    EXPECT_EQ(idOf(10), "org.example.Edit");
    writeEntry(entry, "Exec=other");
    clock.advance(100ms);
    EXPECT_EQ(idOf(10), "org.example.Edit") << "an unchanged directory is not read again";
    fs::last_write_time(folder, now + 20s);
    EXPECT_EQ(idOf(10), "org.example.Edit") << "nor is one looked at again at once";
    clock.advance(100ms);
    EXPECT_FALSE(idOf(10));
    writeEntry(entry, "Exec=edit");
    fs::last_write_time(folder, now + 20s);
    clock.advance(100ms);
    EXPECT_EQ(idOf(10), "org.example.Edit") << "one that changed just before may have changed again";
    fs::remove_all(folder);
    clock.advance(100ms);
    EXPECT_FALSE(idOf(10));
}

} // namespace
