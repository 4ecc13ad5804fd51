#include "server/AgentKeeper.h"
#include "tests/support/InMemoryPorts.h"
#include "tests/support/InMemoryProcessTable.h"
#include "tests/support/ManualMainLoop.h"

#include <gmock/gmock.h>

using namespace tessel;
using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::IsEmpty;

namespace {

constexpr const char* agentID = "com.corvane.tesselStartMenu";

struct Session : ProgramStarter {
    std::optional<int> start(const std::string&) override {
        if (!canStart) return {};
        started.push_back(2001 + static_cast<int>(started.size()));
        agent = processes.start(started.back(), agentID);
        return started.back();
    }
    std::optional<std::string> reap(int pid) override {
        reaped.push_back(pid);
        return fault;
    }

    InMemoryProcessTable processes;
    ManualMainLoop loop;
    InMemoryPortNetwork network;
    InMemoryPorts ports{network, loop, {1000, processes.currentProcess()}};
    bool canStart = true;
    std::optional<std::string> fault = "signal 9";
    platform::ProcessSerialNumber agent;
    std::vector<int> started, reaped;
    std::optional<AgentKeeper> keeper{
        std::in_place, AgentKeeper::Services{*this, processes, ports, loop, loop.clock()}, "/agent"};
};

} // namespace

TEST(AgentKeeper, StartsTheAgentAgainWithGrowingPatience) {
    Session session;
    session.canStart = false;
    session.keeper->run();
    session.canStart = true;
    session.loop.advance(250ms);
    ASSERT_THAT(session.started, ElementsAre(2001));
    session.loop.advance(11s);
    session.processes.end(session.agent);
    EXPECT_THAT(session.reaped, ElementsAre(2001));
    EXPECT_EQ(session.started.size(), 1u) << "not at once";
    session.loop.advance(250ms);
    ASSERT_EQ(session.started.size(), 2u);
    session.processes.end(session.agent);
    session.loop.advance(499ms);
    EXPECT_EQ(session.started.size(), 2u) << "it ended soon: the wait doubles";
    session.loop.advance(1ms);
    EXPECT_EQ(session.started.size(), 3u);
    session.fault.reset();
    session.processes.end(session.agent);
    session.loop.advance(60s);
    EXPECT_EQ(session.started.size(), 3u) << "it was asked to end";

    EXPECT_EQ(RestartDelay(40s, 1s), 60s);
    EXPECT_EQ(RestartDelay(60s, 9s), 60s);
    EXPECT_EQ(RestartDelay(60s, 10s), 250ms);
}

TEST(AgentKeeper, KeepsTheAgentThatAKilledDaemonLeft) {
    Session session;
    session.processes.start(300, agentID); // of another session: it has no port here
    const auto left = session.processes.start(400, agentID);
    const auto port = session.ports.open("com.corvane.kxipc." + std::to_string(left.highLongOfPSN) + ".400");
    session.keeper->run();
    EXPECT_THAT(session.started, IsEmpty());
    port->close();
    session.processes.end(left);
    session.loop.advance(250ms);
    EXPECT_THAT(session.started, ElementsAre(2001));
    EXPECT_THAT(session.reaped, IsEmpty()) << "it was not ours to wait for";
    session.keeper.reset();
    EXPECT_FALSE(session.processes.info(session.agent)) << "ours ends with its daemon";
}
