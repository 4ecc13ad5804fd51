#include "server/StartMenuServer.h"

#include "lib/ipc/KXIPCClient.h"
#include "tests/ipc/Peer.h"
#include "tests/server/FakeMachine.h"

using namespace tessel;
using plist::Dictionary;
using plist::Value;
using testing::ElementsAre;
using testing::HasSubstr;

namespace {

/// A daemon with two machines, and an agent.
struct StartMenuServerTest : testing::Test {
    StartMenuServerTest() {
        for (const char* id : {"one", "two"})
            machines.push_back(std::make_unique<FakeMachine>(id));
        record.open(recordPath());
        const auto note = [this](const KXNotification& notification) {
            received.push_back(notification.name);
            if (notification.name == "menu.update") update = KXUserInfo(notification);
        };
        const KXIPCObserverEntryRow rows[] = {{"menu.update", note, {}}, {"menu.show", note, {}}};
        agent.addEntries(KXIPCObserverEntryArray(rows, 2), this);
    }
    void start(const StartMenuServer::Options& options = {}) {
        const Executor execute = [this](const Job& job) { world.loop.post(job()); };
        service.emplace(server, machines, execute, record, options);
        world.loop.runPending();
        server.setAllowIncomingMessages(true);
        agent.setAllowIncomingMessages(true);
    }
    /// What the agent gets: exactly these, in this order.
    void expect(std::vector<std::string> names) {
        EXPECT_TRUE(world.loop.runUntil([&] { return received.size() >= names.size(); }));
        world.loop.runPending();
        EXPECT_EQ(std::exchange(received, {}), names);
    }
    void post(const char* name, Value userInfo = {}) {
        agent.postMessage({name, std::nullopt, std::move(userInfo)}, false);
    }
    void act(const char* token) {
        post("menu.onAction", Dictionary{{"action", "launchApplication:"}, {"representedObject", token}});
    }
    std::string recorded() const { return ScratchHome::contents(recordPath()); }
    FakeMachine& machine(std::size_t index) { return static_cast<FakeMachine&>(*machines[index]); }
    std::string recordPath() const { return world.home.path() / "record"; }
    std::string shownTitle() const { return update["menu"]["allPrograms"].at(0)["title"].stringOr(""); }

    World world;
    Peer serverPeer{world, Peer::server};
    Peer agentPeer{world, Peer::client};
    std::vector<std::unique_ptr<Machine>> machines;
    Record record;
    KXIPCServer server{serverPeer.context};
    std::optional<StartMenuServer> service;
    KXIPCClient agent{agentPeer.context};
    std::vector<std::string> received;
    Value update;
};

} // namespace

TEST_F(StartMenuServerTest, GivesTheMenuToAnAgentThatComesAndShowsItWhenAskedTo) {
    start({.selected = 1, .showWhenConnected = true});
    expect({"menu.update", "menu.show"});
    EXPECT_EQ(update["nameList"], (Value(plist::Array{"Machine one", "Machine two"})));
    EXPECT_EQ(update["selectedIndex"].intValue(), 1);
    EXPECT_EQ(shownTitle(), "two's a");
    EXPECT_THAT(recorded(), HasSubstr("menu.update sent {\"menu\": {\"topMenu\": 0"));
}

TEST_F(StartMenuServerTest, AnswersRefreshAndSelection) {
    start();
    expect({"menu.update"});
    EXPECT_EQ(shownTitle(), "one's a");
    post("menu.refresh");
    expect({"menu.update"});
    for (const Value& index : {Value(2), Value(-1), Value(std::uint64_t{1} << 63)})
        post("menu.selectIndex", Dictionary{{"selectedIndex", index}});
    post("menu.settings");
    post("menu.selectIndex", Dictionary{{"selectedIndex", 1}});
    expect({"menu.update"});
    EXPECT_EQ(update["selectedIndex"].intValue(), 1);
    EXPECT_EQ(shownTitle(), "two's a");
    EXPECT_EQ(world.logged("there is no machine"), 3);
    EXPECT_EQ(world.logged("no settings to show"), 1);
}

TEST_F(StartMenuServerTest, LaunchesWhatItOfferedAndNothingElse) {
    start();
    expect({"menu.update"});
    act("one/b");
    expect({"menu.update"});
    EXPECT_EQ(update["menu"]["frequentlyUsedApps"].at(0)["title"], Value("b"));
    EXPECT_THAT(recorded(), HasSubstr("menu.onAction received {\"action\": \"launchApplication:\", "
                                      "\"representedObject\": \"one/b\"}\n"
                                      "launchApplication: performed {\"representedObject\": \"one/b\"}\n"));
    machine(1).failure = "because";
    for (const char* token : {"two/a", "one/c", "three/a", "", "one", "/"}) // the first is shown no more
        act(token);
    post("menu.onAction");
    post("menu.onAction", Dictionary{{"action", 7}, {"representedObject", plist::Array{"one/a"}}});
    EXPECT_TRUE(world.loop.runUntil([&] { return world.logged("refused to act on") == 7; }));
    EXPECT_THAT(recorded(), HasSubstr("failed {\"representedObject\": \"two/a\", \"reason\": \"because\"}"));
    EXPECT_EQ(world.logged("could not launch \"a\": because"), 1);
    EXPECT_THAT(machine(0).launched, ElementsAre("b"));
    EXPECT_TRUE(received.empty());
}
