#include "platform/linux/Backlog.h"
#include "tests/platform/PortWorlds.h"
#include "tests/support/RawPeer.h"

#include <gtest/gtest.h>

// What becomes of more than a receiver's main thread can handle.

using namespace std::chrono_literals;
using namespace platform;

namespace {

const std::string name = "com.example.port";

struct BackPressure : testing::Test, UnixWorld {};

} // namespace

TEST(Backlog, admitsEachSenderUpToItsQuotaAndAllUpToTheWhole) {
    int calls = 0;
    Backlog backlog([&] { ++calls; });
    const auto [messages, bytes] = Backlog::ofSender;
    backlog.add(2, bytes - 1);
    EXPECT_TRUE(backlog.admits(2));
    backlog.add(2, Backlog::ofAll.bytes);
    EXPECT_FALSE(backlog.admits(2)) << "the last may be of any size";
    backlog.add(1, 0);
    EXPECT_FALSE(backlog.admits(1)) << "there is too much of all";
    EXPECT_TRUE(backlog.admits(3)) << "who has nothing waiting is let in even so";
    backlog.remove(2, Backlog::ofAll.bytes);
    EXPECT_EQ(calls, 1);
    EXPECT_TRUE(backlog.admits(1));
    EXPECT_TRUE(backlog.admits(2));

    // A sender with two connections: the one that is let in again must not make the other be forgotten.
    for (std::size_t i = 0; i < messages; ++i)
        backlog.add(4, 0);
    EXPECT_FALSE(backlog.admits(4));
    backlog.remove(4, 0);
    EXPECT_TRUE(backlog.admits(4));
    EXPECT_EQ(calls, 1) << "not before half is free";
    for (std::size_t i = 1; i < messages; ++i)
        backlog.remove(4, 0);
    EXPECT_EQ(calls, 2);
}

TEST_F(BackPressure, aSenderHasSoManyConnectionsAndNoMore) {
    Listener listener(loop, server, name);
    std::vector<std::unique_ptr<RawPeer>> peers;
    for (int i = 0; i < 16; ++i)
        peers.push_back(std::make_unique<RawPeer>(directory, name));
    for (int i = 0; i < 12; ++i)
        EXPECT_TRUE(RawPeer(directory, name).isCutOff());
    EXPECT_EQ(ScratchHome::logged(": too many\n"), 10) << "a minute";
    for (const auto& peer : peers)
        peer->send(GoodPackets().front());
    ASSERT_TRUE(listener.waitFor(peers.size()));
    listener.arrivals().clear();
    peers.pop_back();
    // Turned away as long as the port has not seen that end.
    const auto hasCome = [&] { return !listener.arrivals().empty(); };
    for (int tries = 0; tries < 1000 && !hasCome(); ++tries) {
        RawPeer(directory, name).trySend(GoodPackets().front());
        loop.runUntil(hasCome, 20ms);
    }
    EXPECT_TRUE(hasCome()) << "once one has gone";
}
