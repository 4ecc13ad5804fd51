#include "lib/ipc/KXIPCClient.h"
#include "lib/ipc/KXIPCCommon.h"
#include "lib/ipc/KXIPCServer.h"
#include "tests/ipc/Peer.h"

using testing::ElementsAre;
using testing::IsEmpty;

namespace {

struct KXIPCCommonTest : testing::Test {
    struct Subject : KXIPCCommon {
        using KXIPCCommon::KXIPCCommon;
        std::string portName() const override { return "p"; }
    };
    /// Notes its mark when called, and does what `actions` has for it.
    KXIPCObserverEntry::Array entry(const std::string& mark, const char* name,
                                    std::optional<std::string> object = {}) {
        const auto call = [this, mark](const KXNotification& notification) {
            calls.push_back(mark);
            last = notification;
            if (actions[mark]) actions[mark]();
        };
        const KXIPCObserverEntryRow row{name, call, std::move(object)};
        return KXIPCObserverEntryArray(&row, 1);
    }
    std::vector<std::string> post(std::optional<std::string> object = {}) {
        calls.clear();
        common.postMessage(KXIPCMessage("n", std::move(object), plist::Dictionary{{"key", 1}}), true);
        return calls;
    }
    bool receive(std::int64_t messageID, plist::Value sender = 1) {
        calls.clear();
        common.onRemoteMessageReceived(plist::Dictionary{{"message", plist::Dictionary{{"name", "n"}}},
                                                         {"psnKey", std::move(sender)},
                                                         {"messageID", messageID}});
        return !calls.empty();
    }

    World world;
    Peer peer{world, Peer::server};
    Subject common{peer.context};
    int a = 0, b = 0; ///< observers
    std::vector<std::string> calls;
    KXNotification last;
    std::map<std::string, std::function<void()>> actions;
};

TEST_F(KXIPCCommonTest, AcceptsOnlyRisingNumbersOfEachSenderWhileReceiving) {
    common.addEntries(entry("called", "n"), &a);
    EXPECT_FALSE(receive(1)) << "not receiving";
    common.setAllowIncomingMessages(true);
    EXPECT_TRUE(receive(1) && !receive(1) && receive(5) && !receive(4));
    EXPECT_TRUE(receive(1, 2)) << "another sender";
    EXPECT_FALSE(receive(0, 3) || receive(-1, 3));
    EXPECT_FALSE(receive(0x1'0000'0000, 3)) << "0 in 32 bits";
    EXPECT_TRUE(receive(0x1'0000'0007, 3) && !receive(7, 3));
    EXPECT_EQ(
        World::logged(
            "IPC: -[KXIPCCommon onRemoteMessageReceived:]: dropping duplicate or out of order message\n"),
        6);

    EXPECT_TRUE(receive(7, peer.number()));
    for (std::uint32_t sender = 10; sender < 1100; ++sender)
        EXPECT_TRUE(receive(1, sender));
    EXPECT_FALSE(receive(7, peer.number()));
    EXPECT_TRUE(receive(1)) << "has ended, and is forgotten";
}

TEST_F(KXIPCCommonTest, CallsEveryMatchingEntryInOrder) {
    const auto twice = entry("twice", "n");
    for (const auto& entries : {twice, entry("o", "n", "o"), twice, entry("m", "m")})
        common.addEntries(entries, &a);
    common.addEntries(entry("b", "n"), &b);
    EXPECT_THAT(post(), ElementsAre("twice", "twice", "b"));
    EXPECT_THAT(post("o"), ElementsAre("twice", "o", "twice", "b"));
    EXPECT_EQ(last.name, "n");
    EXPECT_EQ(std::any_cast<std::string>(last.object), "o");
    EXPECT_EQ(KXUserInfo(last), plist::Value(plist::Dictionary{{"key", 1}}));
    common.removeEntries(entry("", "n", "o"), &a);
    EXPECT_THAT(post("o"), ElementsAre("twice", "twice", "b"));
    common.removeEntries(entry("", "n"), &a);
    common.removeEntries(entry("", "n"), &calls);
    EXPECT_THAT(post(), ElementsAre("b"));
}

TEST_F(KXIPCCommonTest, HandlersMayChangeTheTableWhileAMessageIsDispatched) {
    actions["first"] = [this] {
        common.removeEntries(entry("", "n", "gone"), &a);
        common.removeEntries(entry("", "n"), &b);
        common.addEntries(entry("late", "n"), &calls);
    };
    actions["third"] = [this] { common.terminateWithDelegate(nullptr); };
    for (const auto& entries :
         {entry("first", "n"), entry("second", "n", "gone"), entry("third", "n"), entry("fourth", "n")})
        common.addEntries(entries, &a);
    common.addEntries(entry("b", "n"), &b);
    EXPECT_THAT(post("gone"), ElementsAre("first", "third"));
    EXPECT_THAT(post(), IsEmpty());

    std::unique_ptr<KXIPCCommon> dying;
    actions["end"] = [&] { dying->terminateWithDelegate([&] { dying.reset(); }); };
    const auto endWith = [&](std::unique_ptr<KXIPCCommon> object) {
        dying = std::move(object);
        for (const auto* observer : {&a, &b})
            dying->addEntries(entry("end", "n"), observer);
        dying->postMessage(KXIPCMessage("n", {}, {}), false);
    };
    endWith(std::make_unique<KXIPCClient>(peer.context));
    endWith(std::make_unique<KXIPCServer>(peer.context));
    EXPECT_THAT(calls, ElementsAre("end", "end"));
}

TEST_F(KXIPCCommonTest, TellsWhenItHasTerminated) {
    int ended = 0;
    const auto terminate = [&] { common.terminateWithDelegate([&] { ++ended; }); };
    terminate();
    EXPECT_EQ(ended, 1) << "at once while not receiving";
    common.setAllowIncomingMessages(true);
    EXPECT_TRUE(common.isReachable());
    terminate();
    EXPECT_EQ(ended, 1);
    ASSERT_TRUE(world.loop.runUntil([&] { return ended == 2 && !common.allowIncomingMessages(); }));

    const auto taken = peer.ports.open("p");
    common.setAllowIncomingMessages(true);
    world.loop.runPending();
    EXPECT_TRUE(common.allowIncomingMessages() && !common.isReachable());
    terminate();
    EXPECT_EQ(ended, 3) << "the end notice of a port that was never open has come already";
}

} // namespace
