#include "platform/linux/Backlog.h"
#include "tests/platform/Child.h"
#include "tests/platform/PortWorlds.h"
#include "tests/platform/RawPeer.h"
#include "tests/support/MappedMessages.h"

#include <gmock/gmock.h>

// What becomes of more than a receiver's main thread can handle.

using namespace std::chrono_literals;
using namespace platform;

namespace {

const std::string name = "com.example.port";

int NumberOf(const Arrival& arrival) {
    return std::atoi(reinterpret_cast<const char*>(arrival.bytes.data())); // it goes on after the digits
}

struct BackPressure : testing::Test, UnixWorld {};

} // namespace

TEST(Backlog, admitsEachSenderUpToItsQuotaAndAllUpToTheWhole) {
    int calls = 0;
    Backlog backlog([&] { ++calls; });
    const auto [messages, bytes] = Backlog::ofSender;
    for (std::size_t i = 0; i < messages; ++i) {
        EXPECT_TRUE(backlog.admits(1));
        backlog.add(1, 0);
    }
    EXPECT_FALSE(backlog.admits(1));
    EXPECT_TRUE(backlog.admits(2));
    backlog.add(2, bytes - 1);
    EXPECT_TRUE(backlog.admits(2));
    backlog.add(2, Backlog::ofAll.bytes);
    EXPECT_FALSE(backlog.admits(2)) << "the last may be of any size";
    backlog.remove(1, 0);
    for (std::size_t i = messages; i-- > 2;)
        backlog.remove(1, 0);
    EXPECT_EQ(calls, 1) << "once, not before half is free";
    EXPECT_FALSE(backlog.admits(1)) << "there is too much of all";
    EXPECT_TRUE(backlog.admits(3)) << "who has nothing waiting is let in even so";
    backlog.remove(2, Backlog::ofAll.bytes);
    EXPECT_EQ(calls, 2);
    EXPECT_TRUE(backlog.admits(1));
    EXPECT_TRUE(backlog.admits(2));

    // A sender with two connections: the one that is let in again must not make the other be forgotten.
    for (std::size_t i = 0; i < messages; ++i)
        backlog.add(4, 0);
    EXPECT_FALSE(backlog.admits(4));
    backlog.remove(4, 0);
    EXPECT_TRUE(backlog.admits(4));
    for (std::size_t i = 1; i < messages; ++i)
        backlog.remove(4, 0);
    EXPECT_EQ(calls, 3);
}

TEST_F(BackPressure, aReceiverThatHangsCostsItsSendersNothingButWhatTheyDrop) {
    Listener listener(loop, server, name);
    const auto remote = client.connect(name);
    constexpr int sent = 60; // more than are kept
    constexpr auto size = std::size_t{8} << 20;
    const std::string rest(size, ' ');
    for (int i = 0; i < sent; ++i)
        ASSERT_EQ(Send(*remote, std::to_string(i) + rest), SendStatus::success);
    EXPECT_EQ(ScratchHome::logged("dropping messages to " + name), 1);

    // Another sender is not disturbed, and no more than its quota was taken from the first.
    const Child other([&] { RawPeer(directory, name).send(GoodPackets().front()); });
    const auto quota = Backlog::ofSender.bytes / size;
    ASSERT_TRUE(listener.waitFor(quota + 1));
    EXPECT_LE(MappedMessages(getpid()), Backlog::ofSender.bytes + 2 * size)
        << "one more of any size, and the other's";
    const auto fromOther = [&](const Arrival& arrival) { return arrival.sender.processID == other.pid(); };
    EXPECT_EQ(std::erase_if(listener.arrivals(), fromOther), 1U);
    EXPECT_EQ(listener.arrivals().size(), quota);

    // It wakes: all that was accepted comes, in order, and the last one after it.
    int handled = 0;
    bool isOver = false;
    const auto handle = [&] {
        for (const auto& arrival : std::exchange(listener.arrivals(), {})) {
            isOver = arrival.bytes.empty();
            EXPECT_TRUE(isOver || NumberOf(arrival) == handled++);
        }
        return isOver;
    };
    ASSERT_TRUE(loop.runUntil([&] { return handle() || handled > sent / 4; }));
    remote->send({}, false, {20s, 20s});
    ASSERT_TRUE(loop.runUntil(handle));
    EXPECT_GT(handled, 37);
    EXPECT_LT(handled, 53) << "as many on their way as are let in, and 256 MiB in the queue";
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
        RawPeer(directory, name).trySend(GoodPackets().front().bytes);
        loop.runUntil(hasCome, 20ms);
    }
    EXPECT_TRUE(hasCome()) << "once one has gone";
}
