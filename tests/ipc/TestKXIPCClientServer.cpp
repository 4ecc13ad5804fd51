#include "lib/ipc/KXIPCClient.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCServer.h"
#include "tests/ipc/Peer.h"

using plist::Dictionary;
using plist::Value;
using testing::ElementsAre;

namespace {

constexpr auto add = KX_IPC_ADD_LISTENER_NOTIFICATION, removal = KX_IPC_REMOVE_LISTENER_NOTIFICATION;

/// A server and a client, each a process of its own but for the main loop.
struct KXIPCClientServerTest : testing::Test {
    KXIPCObserverEntry::Array entry(const char* name) {
        const KXIPCObserverEntryRow row{name,
                                        [this, name](const KXNotification& notification) {
                                            calls.push_back(name);
                                            last = KXUserInfo(notification);
                                        },
                                        {}};
        return KXIPCObserverEntryArray(&row, 1);
    }
    /// The server notes what control messages reach it.
    void startServer() {
        server.emplace(serverPeer->context);
        for (const auto* name : {add, removal})
            server->addEntries(entry(name), this);
        server->setAllowIncomingMessages(true);
    }
    bool runUntilCalled(std::size_t count) {
        return world.loop.runUntil([&] { return calls.size() >= count; });
    }
    bool runUntilConfirmed() {
        return world.loop.runUntil([&] { return client.serverProcess() != nullptr; });
    }
    static KXIPCMessage message(const char* name, Value userInfo = {}) {
        return {name, {}, std::move(userInfo)};
    }
    std::size_t clients() { return server->clientsForMessage(message("n")).size(); }

    World world;
    InMemoryNotificationNetwork elsewhere;
    std::optional<Peer> serverPeer{std::in_place, world, Peer::server};
    Peer clientPeer{world, Peer::client}, other{world, Peer::other};
    std::optional<KXIPCServer> server;
    KXIPCClient client{clientPeer.context};
    std::vector<std::string> calls;
    Value last;
};

TEST_F(KXIPCClientServerTest, ObserversFromBeforeTheServerGoOutInOneMessageAndAreConfirmedOnce) {
    client.addEntries(entry("n"), this);
    client.setAllowIncomingMessages(true);
    client.postMessage(message("n"), false);
    EXPECT_FALSE(client.isConnected());
    EXPECT_EQ(client.portName(), "com.corvane.kxipc.3.3000");

    startServer();
    ASSERT_TRUE(runUntilConfirmed());
    EXPECT_TRUE(client.isConnected());
    EXPECT_EQ(client.serverProcess()->processSerialNumber(), serverPeer->psn);
    EXPECT_THAT(calls, ElementsAre("n", add)) << "posted to local observers only";
    const Value table = plist::Array{Dictionary{{"name", KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION}},
                                     Dictionary{{"name", "n"}}};
    EXPECT_EQ(last,
              Value(Dictionary{{KX_IPC_PARAM_MSG_TABLE, table}, {KX_IPC_PARAM_PSN, clientPeer.number()}}));

    // Another launch notice sends nothing, another add is not confirmed, two matching entries are one
    // delivery.
    client.KXIPCCommon::addEntries(entry(KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION), this);
    server->setAllowIncomingMessages(true);
    world.loop.runPending();
    client.addEntries(entry("n"), this);
    ASSERT_TRUE(runUntilCalled(3));
    EXPECT_EQ(last[KX_IPC_PARAM_MSG_TABLE].size(), 1U);
    server->postMessage(message("n"), false);
    server->postMessage(message("n"), false);
    ASSERT_TRUE(runUntilCalled(7));
    EXPECT_THAT(calls, ElementsAre("n", add, add, "n", "n", "n", "n"));
    EXPECT_EQ(ScratchHome::log(), "");
}

TEST_F(KXIPCClientServerTest, OnlyARemoveAllOrItsDeathTakesAClientAway) {
    startServer();
    client.addEntries(entry("n"), this);
    client.setAllowIncomingMessages(true);
    ASSERT_TRUE(runUntilConfirmed());
    client.removeEntries(entry("n"), this);
    ASSERT_TRUE(runUntilCalled(2));
    EXPECT_EQ(last[KX_IPC_PARAM_MSG_TABLE], Value(plist::Array{Dictionary{{"name", "n"}}}));
    EXPECT_EQ(clients(), 1U) << "a partial removal removes nothing";

    client.setAllowIncomingMessages(false);
    client.updateServerConnection();
    ASSERT_TRUE(runUntilCalled(4));
    EXPECT_THAT(calls, ElementsAre(add, removal, removal, removal));
    EXPECT_EQ(last,
              Value(Dictionary{{KX_IPC_PARAM_ALL_MESSAGES, true}, {KX_IPC_PARAM_PSN, clientPeer.number()}}));
    EXPECT_EQ(clients(), 0U);
    EXPECT_TRUE(client.isConnected()) << "so it does not register again by itself";
    client.setAllowIncomingMessages(true);
    client.addEntries(entry("n"), this);
    ASSERT_TRUE(runUntilConfirmed()) << "a second time";
    EXPECT_EQ(clients(), 1U);
    serverPeer->processes.end(clientPeer.psn);
    EXPECT_EQ(clients(), 0U);
}

TEST_F(KXIPCClientServerTest, NobodyIsAddedWithoutANameOrTakenAwayByAnother) {
    startServer();
    const Value table = plist::Array{Dictionary{{"name", "n"}}};
    const auto clientsAfterAdd = [&](Dictionary userInfo) {
        server->postMessage(message(add, std::move(userInfo)), false);
        return clients();
    };
    EXPECT_EQ(clientsAfterAdd({{KX_IPC_PARAM_MSG_TABLE, table}, {KX_IPC_PARAM_PSN, "1"}}), 0U);
    EXPECT_EQ(clientsAfterAdd({{KX_IPC_PARAM_PSN, clientPeer.number()}}), 0U);
    serverPeer->processes.end(other.psn);
    EXPECT_EQ(clientsAfterAdd({{KX_IPC_PARAM_MSG_TABLE, table}, {KX_IPC_PARAM_PSN, other.number()}}), 0U)
        << "dead";
    EXPECT_EQ(clientsAfterAdd({{KX_IPC_PARAM_MSG_TABLE, table}, {KX_IPC_PARAM_PSN, clientPeer.number()}}),
              1U);
    for (const unsigned size : {9U, 9U, 20U}) { // MiB; not more than 16 together
        const Value large = plist::Array{Dictionary{{"name", std::string(size << 20, 'x')}}};
        clientsAfterAdd({{KX_IPC_PARAM_MSG_TABLE, large}, {KX_IPC_PARAM_PSN, clientPeer.number()}});
    }
    EXPECT_EQ(World::logged("dropping entries of process 3000, which has too many\n"), 2);

    const Value all = Dictionary{{KX_IPC_PARAM_ALL_MESSAGES, true}, {KX_IPC_PARAM_PSN, clientPeer.number()}};
    server->addEntries(entry("after"), this);
    other.sendRaw(KX_IPC_ServerPortName(), KXIPCEnvelope(message(removal, all), other.psn, 1, false));
    other.sendRaw(KX_IPC_ServerPortName(), KXIPCEnvelope(message("after"), other.psn, 2, false));
    ASSERT_TRUE(world.loop.runUntil([&] { return calls.back() == "after"; }));
    const auto kept = server->clientsForMessage(message("n"));
    EXPECT_EQ(kept.size(), 1U);
    server.reset();
    EXPECT_EQ(serverPeer->processes.watchCount(), 0) << "nothing would be called that is gone";
}

TEST_F(KXIPCClientServerTest, AClientFollowsItsServersEndAndTheNextOne) {
    const auto isRegistered = [&] { return clients() == 1; };
    int ended = 0;
    startServer();
    client.addEntries(entry("n"), this);
    client.setAllowIncomingMessages(true);
    ASSERT_TRUE(world.loop.runUntil(isRegistered));
    server->terminateWithDelegate([&] { ++ended; });
    EXPECT_EQ(clients(), 0U);
    ASSERT_TRUE(world.loop.runUntil([&] { return ended == 1 && !client.isConnected(); }));
    startServer();
    ASSERT_TRUE(world.loop.runUntil(isRegistered));

    // One that comes too late tells nobody that a server was started.
    std::vector<std::string> notices;
    const auto note = [&](const char* name) {
        return clientPeer.notices.observe(name, [&notices, name] { notices.emplace_back(name); });
    };
    other.notices.post("earlier");
    const auto earlier = note("earlier"), launch = note(KX_IPC_SERVER_DID_LAUNCH_NOTIFICATION);
    ASSERT_TRUE(world.loop.runUntil([&] { return !notices.empty() && notices.back() == "earlier"; }));
    notices.clear();
    const auto later = note("later");
    KXIPCServer(other.context).setAllowIncomingMessages(true);
    other.notices.post("later");
    ASSERT_TRUE(world.loop.runUntil([&] { return !notices.empty(); }));
    EXPECT_THAT(notices, ElementsAre("later"));

    // Killed; a new one has the name before the client's main loop turns again, and its launch notice is
    // lost.
    server.reset();
    serverPeer.emplace(world, Peer::other, elsewhere);
    startServer();
    ASSERT_TRUE(world.loop.runUntil(isRegistered));
    client.terminateWithDelegate([&] { ++ended; });
    ASSERT_TRUE(world.loop.runUntil([&] { return ended == 2 && !isRegistered(); }));
}

} // namespace
