#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCSend.h"
#include "tests/ipc/Peer.h"

#include <atomic>
#include <thread>

using testing::ElementsAre;
using testing::IsEmpty;

namespace {

struct KXIPCMessageReceiverTest : testing::Test {
    void send(int messageID, const Peer& from) {
        sender.sendRaw("p", KXIPCEnvelope(KXIPCMessage("n", {}, {}), from.psn, messageID, false));
    }
    bool runUntilNoted(std::size_t count) {
        return world.loop.runUntil([&] { return delegate.noted.size() >= count; });
    }

    World world;
    Peer sender{world, Peer::client}, owner{world, Peer::server};
    Collector delegate;
    std::optional<KXIPCMessageReceiver> receiver{std::in_place, owner.context, delegate};
};

TEST_F(KXIPCMessageReceiverTest, NameIsTakenAndGivenUpInsideTheCalls) {
    receiver->stopReceiving();
    receiver->startReceivingWithPortName("p");
    receiver->startReceivingWithPortName("q");
    EXPECT_THAT(sender.ports.listeningNames(), ElementsAre("p"));
    send(1, sender);
    ASSERT_TRUE(runUntilNoted(1));
    receiver->stopReceiving();
    EXPECT_THAT(sender.ports.listeningNames(), IsEmpty());
    receiver->startReceivingWithPortName("p");
    ASSERT_TRUE(runUntilNoted(2));
    send(2, sender);
    ASSERT_TRUE(runUntilNoted(3));
    receiver->stopReceiving();
    receiver->stopReceiving();
    ASSERT_TRUE(runUntilNoted(4));
    world.loop.runPending();
    EXPECT_THAT(delegate.noted, ElementsAre(1, 0, 2, 0));
    EXPECT_EQ(ScratchHome::log(), "");
}

TEST_F(KXIPCMessageReceiverTest, ATakenNameIsLoggedAndEndsTheReceiver) {
    const auto taken = sender.ports.open("p");
    receiver->startReceivingWithPortName("p");
    EXPECT_EQ(
        World::logged("-[KXIPCMessageReceiver workerThreadStartReceiving:], listening for messages failed\n"),
        1);
    EXPECT_THAT(delegate.noted, IsEmpty());
    world.loop.runPending();
    EXPECT_TRUE(receiver->messageReceiverThread());
    receiver->stopReceiving();
    world.loop.runPending();
    EXPECT_FALSE(receiver->messageReceiverThread());
    EXPECT_THAT(delegate.noted, ElementsAre(0));
}

TEST_F(KXIPCMessageReceiverTest, WhatIsMalformedOrFalseIsLoggedAndDropped) {
    receiver->startReceivingWithPortName("p");
    sender.sendRaw("p", plist::Data::copyOf("rubbish", 7));
    sender.sendRaw("p", plist::Value("no envelope"));
    send(1, owner);
    sender.sendRaw("p", plist::Dictionary{{"message", plist::Dictionary()}, {"psnKey", sender.number()}});
    ASSERT_TRUE(runUntilNoted(1));
    EXPECT_EQ(World::logged("IPC: WorkerThreadOnMessageReceived: unable to parse remote message. Error: "),
              2);
    EXPECT_EQ(World::logged("dropping message that process 3000 sent in another's name\n"), 1);
    for (int i = 0; i < 100; ++i)
        send(1, owner);
    send(1, sender);
    ASSERT_TRUE(runUntilNoted(2));
    EXPECT_THAT(delegate.noted, ElementsAre(0, 1)) << "a message may lack its number";
    EXPECT_EQ(World::logged("IPC: "), 10);
}

TEST_F(KXIPCMessageReceiverTest, ASynchronousSenderWaitsUntilTheHandlerRan) {
    receiver->startReceivingWithPortName("p");
    std::atomic<bool> isSent = false;
    delegate.onMessage = [&] {
        std::this_thread::sleep_for(
            std::chrono::milliseconds(20)); // so that one that does not wait is caught
        EXPECT_FALSE(isSent);
    };
    std::thread thread([&] {
        KX_IPC_SendMessageToNamedPort(sender.context, KXIPCMessage("n", {}, {}), "p", true);
        isSent = true;
        world.loop.post([] {}); // wakes it
    });
    EXPECT_TRUE(world.loop.runUntil([&] { return isSent.load(); }));
    thread.join();
    EXPECT_THAT(delegate.noted, ElementsAre(1));
}

TEST_F(KXIPCMessageReceiverTest, ItsEndInAHandlerWithdrawsTheRest) {
    delegate.onMessage = [&] { receiver.reset(); };
    receiver->startReceivingWithPortName("p");
    for (int i = 1; i <= 3; ++i)
        send(i, sender);
    ASSERT_TRUE(world.loop.runUntil([&] { return !receiver; }));
    world.loop.runPending();
    EXPECT_THAT(delegate.noted, ElementsAre(1));
    EXPECT_THAT(sender.ports.listeningNames(), IsEmpty());
}

} // namespace
