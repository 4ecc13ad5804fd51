#include "platform/linux/UnixPortWatches.h"

#include "lib/plist/Binary.h"
#include "tests/platform/PortWorlds.h"
#include "tests/support/RawPeer.h"

#include <array>
#include <gmock/gmock.h>

using namespace platform;

namespace {

struct Watcher final : PortWatchDelegate {
    void onStatistics(const SharedBytes& propertyList) override {
        std::string error;
        statistics = plist::Parse(propertyList, error);
    }
    void onMessage(const PassingMessage& message) override {
        messages.push_back(message);
        lost += message.missed;
    }
    void onEnd() override { ended = true; }

    plist::Value statistics;
    std::vector<PassingMessage> messages;
    std::uint64_t lost = 0;
    bool ended = false;
};

struct PortWatchesTest : testing::Test, UnixWorld {
    static void answer(Arrival& arrival) { arrival.receipt.reset(); }

    UnixPortWatches watches{loop, directory};
    Watcher watcher;
};

TEST_F(PortWatchesTest, TellOfWhatComesAndGoesUntilTheEnd) {
    EXPECT_FALSE(watches.watch("a", watcher));
    Listener a(loop, server, "a", answer), b(loop, client, "b");
    const auto toA = client.connect("a");
    ASSERT_EQ(Send(*toA, "before"), SendStatus::success);
    const auto watch = watches.watch("a", watcher);
    ASSERT_TRUE(loop.runUntil([&] { return watcher.statistics.size() > 0; }));
    EXPECT_EQ(watcher.statistics["connections"].intValue(), 1);
    EXPECT_EQ(watcher.statistics["received"].intValue(), 1);
    EXPECT_EQ(watcher.statistics["sent"].intValue(), 0);

    Send(*toA, "question", true);
    Send(*toA, std::string(250'000, 'x'), true);
    const auto toB = server.connect("b");
    Send(*toB, std::string(300'000, 'x'));
    Send(*toB, "");
    ASSERT_TRUE(loop.runUntil([&] { return watcher.messages.size() == 4 && a.arrivals().size() == 3; }));
    std::string seen;
    for (const auto& message : watcher.messages) {
        EXPECT_EQ(message.processID, getpid());
        seen += (message.outgoing ? "out " : "in ") + std::to_string(message.bytes.size()) +
                (message.synchronous ? " waits, " : ", ");
    }
    EXPECT_EQ(seen, "in 8 waits, in 250000 waits, out 300000, out 0, ");
    EXPECT_EQ(watcher.messages[0].bytes, SharedBytes::copyOf("question", 8));
    EXPECT_EQ(watcher.lost, 0U);
    a.close();
    EXPECT_TRUE(loop.runUntil([&] { return watcher.ended; }));
}

TEST_F(PortWatchesTest, NeverMakeTheWatchedWaitAndKnowWhatTheyMissed) {
    Listener a(loop, server, "a", answer);
    const auto toA = client.connect("a");
    auto watch = watches.watch("a", watcher);
    ASSERT_TRUE(loop.runUntil([&] { return watcher.statistics.size() > 0; }));
    constexpr std::size_t count = 500;
    for (std::size_t i = 0; i < count; ++i) // without a turn of the watcher's loop
        ASSERT_EQ(Send(*toA, std::string(5'000, 'x'), true), SendStatus::success);
    Send(*toA, "last");
    ASSERT_TRUE(a.waitFor(count + 1));
    loop.runPending();
    Send(*toA, "after");
    ASSERT_TRUE(loop.runUntil([&] { return watcher.lost > 0 && watcher.messages.back().bytes.size() == 5; }));
    EXPECT_EQ(watcher.messages.size() + watcher.lost, count + 2);

    // Who asks again and again is told how it is each time, and gets one copy.
    RawPeer eager(directory, "a");
    std::array<char, 1000> packet;
    for (int i = 0; i < 3; ++i) {
        eager.send({"a request", RawHeader({.flags = PacketHeader::tap})});
        EXPECT_GT(eager.receive(packet.data(), packet.size()), 100);
    }
    for (const char sent : {'x', 'y'}) {
        Send(*toA, {sent}, true);
        EXPECT_EQ(eager.receive(packet.data(), packet.size()), 25);
        EXPECT_EQ(packet[24], sent);
    }

    watch.reset();
    Watcher second;
    Send(*toA, "x", true);
    watch = watches.watch("a", second);
    ASSERT_TRUE(loop.runUntil([&] { return second.statistics.size() > 0; }));
    EXPECT_EQ(second.statistics["connections"].intValue(), 1) << "without those of watchers";
}

} // namespace
