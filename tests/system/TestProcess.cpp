#include "lib/kxAppKit/system/KXProcess.h"
#include "lib/kxAppKit/system/KXWorkspace.h"
#include "tests/support/InMemoryDesktop.h"
#include "tests/support/InMemoryProcessTable.h"
#include "tests/support/ScratchHome.h"

#include <gmock/gmock.h>

using testing::ElementsAre;

namespace {

const char *const first = "first", *const second = "second", *const third = "third";

class ProcessDeath : public testing::Test {
protected:
    void observe(const char* owner, std::function<void()> also = nullptr) {
        m_process->addObserverForProcessDeath(owner, [this, owner, also](KXProcess& dead) {
            EXPECT_FALSE(dead.isValid());
            m_called.push_back(owner);
            if (also) also();
        });
    }

    InMemoryProcessTable m_table;
    ProcessSerialNumber m_psn = m_table.start(2000, "com.example.guest");
    KXProcess::Pointer m_process = KXProcess::processWithSerialNumber(m_table, m_psn);
    std::vector<std::string> m_called;
};

TEST_F(ProcessDeath, CallsInTheOrderOfAddingWhileThereAreObserversAndAHandle) {
    observe(first);
    observe(second);
    m_process->removeObserverForProcessDeath(first);
    EXPECT_EQ(m_table.watchCount(), 1);
    m_process->removeObserverForProcessDeath(second);
    EXPECT_EQ(m_table.watchCount(), 0);
    for (const char* owner : {first, second, first})
        observe(owner);
    EXPECT_EQ(m_table.watchCount(), 1);
    m_table.end(m_psn);
    EXPECT_THAT(m_called, ElementsAre(first, second, first));
    EXPECT_EQ(m_table.watchCount(), 0);

    m_process = KXProcess::processWithSerialNumber(m_table, m_table.start(2000));
    observe(third);
    m_process.reset();
    EXPECT_EQ(m_table.watchCount(), 0);
}

TEST_F(ProcessDeath, ObserversMayRemoveThemselvesAndOthersAndTheHandleWhileCalled) {
    observe(first, [this] {
        m_process->removeObserverForProcessDeath(first);
        m_process->removeObserverForProcessDeath(second);
        m_process.reset();
    });
    observe(second);
    observe(third);
    m_table.end(m_psn);
    EXPECT_THAT(m_called, ElementsAre(first, third));
}

TEST_F(ProcessDeath, RefusesAnObserverAfterwards) {
    const ScratchHome home;
    observe(first, [this] { observe(second); });
    m_table.end(m_psn);
    const auto reborn = m_table.start(2000, "com.example.guest");
    observe(third);
    m_table.end(reborn);
    EXPECT_THAT(m_called, ElementsAre(first));
    const std::string entry =
        "-\\[KXProcess addObserverForProcessDeath:selector:\\]: unable to register, ignoring request\n";
    EXPECT_THAT(ScratchHome::log(), testing::MatchesRegex("[^\n]*" + entry + "[^\n]*" + entry));
}

TEST(Process, HandlesOutliveTheirProcess) {
    InMemoryProcessTable table;
    const auto psn = table.start({{0, 2000}, "/a b/run", "org.run", "/a b/\u00e9.desktop", true, false});
    const auto process = KXProcess::processWithSerialNumber(table, psn);
    EXPECT_EQ(process->pid(), 2000);
    EXPECT_EQ(process->url(), "file:///a%20b/%C3%A9.desktop");
    EXPECT_EQ(process->info()["CFBundleExecutable"].string(), "/a b/run");
    EXPECT_FALSE(process->hasUI());
    EXPECT_TRUE(process->kill());
    const ProcessSerialNumber large{0xFFFFFFFE, 0x80000001};
    EXPECT_EQ(KXNumberFromProcessSerialNumber(large), 0xFFFFFFFE80000001u);
    EXPECT_EQ(KXProcessSerialNumberFromNumber(0xFFFFFFFE80000001u), large);

    const auto other = KXProcess::processWithSerialNumber(table, table.start(2000, "com.example.other"));
    EXPECT_TRUE(other->hasUI());
    EXPECT_FALSE(process->isEqual(other.get()));
    EXPECT_FALSE(process->isEqual(nullptr));
    EXPECT_TRUE(process->isEqual(KXProcess::processWithSerialNumber(table, psn).get()));
    EXPECT_EQ(process->pid(), 0);
    EXPECT_TRUE(process->info().isNil());
    EXPECT_FALSE(process->kill());
    EXPECT_EQ(process->bundleIdentifier(), "org.run");
}

TEST(Process, AreFoundExactlyAndInAscendingOrder) {
    InMemoryProcessTable table;
    table.start(3000, "com.example.guest");
    table.start(2000, "com.example.guest");
    const std::string url = "file:///usr/share/applications/com.example.guest.desktop";
    EXPECT_EQ(KXProcess::processWithBundleIdentifier(table, "com.example.guest")->pid(), 2000);
    EXPECT_EQ(KXProcess::processWithURL(table, url)->pid(), 2000);
    InMemoryDesktop desktop;
    const KXWorkspace workspace(desktop.services(table));
    EXPECT_TRUE(workspace.isAppWithBundleIdentifierRunning("com.example.guest"));
    EXPECT_FALSE(workspace.isAppWithBundleIdentifierRunning("com.example.Guest"));
    EXPECT_FALSE(workspace.isAppWithBundleIdentifierRunning(""));

    const auto current = KXProcess::currentProcess(table);
    EXPECT_EQ(current->pid(), 1000);
    EXPECT_EQ(KXProcess::currentProcess(table), current);
    table.setCurrentProcess(table.start(1001));
    EXPECT_EQ(KXProcess::currentProcess(table)->pid(), 1001);
    table.setCurrentProcess({});
    EXPECT_EQ(KXProcess::currentProcess(table), nullptr);
}

} // namespace
