#include "tests/platform/PortWorlds.h"

#include <gmock/gmock.h>

// The contract of ports and notices, held by the system's and by their twins in memory.

using namespace std::chrono_literals;
using namespace platform;
using testing::ElementsAre;

namespace {
const std::string name = "com.example.port";
} // namespace

template <typename World>
struct PortContract : testing::Test {
    World world;
    ManualMainLoop& loop = world.loop;
};

using Worlds = testing::Types<InMemoryWorld, UnixWorld>;
TYPED_TEST_SUITE(PortContract, Worlds);

TYPED_TEST(PortContract, deliversWholeMessagesInOrderWithTheirSender) {
    Listener listener(this->loop, this->world.server, name);
    std::vector<std::string> sent;
    for (const std::size_t size : {0U, 1U, 200U, 128U * 1024, 128U * 1024 + 1, 5'000'000U, 3U}) {
        std::string text(size, 'x');
        for (std::size_t i = 0; i < size; ++i)
            text[i] = static_cast<char>(i * 31 >> 4);
        sent.push_back(text);
        EXPECT_EQ(Send(*this->world.client.connect(name), text), SendStatus::success);
    }
    ASSERT_TRUE(listener.waitFor(sent.size()));
    for (std::size_t i = 0; i < sent.size(); ++i) {
        EXPECT_TRUE(listener.text(i) == sent[i]) << i;
        EXPECT_EQ(listener.arrivals()[i].sender.processID, this->world.clientPeer.processID);
        EXPECT_EQ(listener.arrivals()[i].sender.serialNumber, this->world.clientPeer.serialNumber);
    }
}

TYPED_TEST(PortContract, givesANameToOneOwnerUntilItCloses) {
    auto& server = this->world.server;
    auto& client = this->world.client;
    EXPECT_FALSE(client.isListening(name));
    EXPECT_EQ(client.connect(name), nullptr);
    const auto first = server.open(name);
    const auto other = server.open("com.example.other");
    ASSERT_TRUE(first && other);
    EXPECT_EQ(server.open(name), nullptr);
    EXPECT_EQ(client.open(name), nullptr);
    EXPECT_TRUE(client.isListening(name));
    EXPECT_THAT(client.listeningNames(), ElementsAre("com.example.other", name));
    first->close();
    EXPECT_FALSE(client.isListening(name));
    EXPECT_EQ(client.connect(name), nullptr);
    EXPECT_THAT(client.listeningNames(), ElementsAre("com.example.other"));
    const auto second = client.open(name);
    EXPECT_TRUE(second);
    first->close();
    EXPECT_TRUE(server.isListening(name));
    first->run([](std::span<Arrival>) { FAIL(); });
}

TYPED_TEST(PortContract, synchronousSendWaitsForTheReceipt) {
    std::atomic<int> handled = 0;
    std::unique_ptr<Receipt> held;
    Listener listener(this->loop, this->world.server, name, [&](Arrival& arrival) {
        if (++handled == 2) held = std::move(arrival.receipt);
        arrival.receipt.reset();
    });
    const auto port = this->world.client.connect(name);
    EXPECT_EQ(Send(*port, "first", true), SendStatus::success);
    EXPECT_EQ(handled, 1);
    EXPECT_EQ(Send(*port, "held", true, 20ms), SendStatus::receiveTimeout);
    ASSERT_TRUE(listener.waitFor(2));
    // An answer that comes too late answers nothing else, and is no hang-up.
    held.reset();
    EXPECT_EQ(Send(*port, "third", true), SendStatus::success);
    EXPECT_EQ(handled, 3);
    EXPECT_TRUE(this->world.client.isListening(name));
}

TYPED_TEST(PortContract, closingEndsTheWaitForMessagesThatWereNotHandedOver) {
    const auto port = this->world.server.open(name);
    const auto remote = this->world.client.connect(name);
    std::thread closer([&] {
        std::this_thread::sleep_for(5ms); // to hit the wait itself; before it, the outcome is the same
        port->close();
    });
    EXPECT_EQ(Send(*remote, "never handled", true), SendStatus::becameInvalid);
    closer.join();
}

TYPED_TEST(PortContract, closingStillAnswersWhatWasHandedOver) {
    Listener* listening = nullptr;
    Listener listener(this->loop, this->world.server, name, [&](Arrival& arrival) {
        listening->close();
        arrival.receipt.reset();
    });
    listening = &listener;
    EXPECT_EQ(Send(*this->world.client.connect(name), "stop", true), SendStatus::success);
}

TYPED_TEST(PortContract, tellsOnceThatTheOwnerHasEndedThoughAnotherOwnsTheName) {
    auto& client = this->world.client;
    std::vector<std::string> hangUps;
    client.setHangUpHandler([&](const std::string& ended) { hangUps.push_back(ended); });
    auto first = std::make_unique<Listener>(this->loop, this->world.server, name);
    ASSERT_TRUE(client.isListening(name));
    Send(*client.connect(name), "to the first");
    ASSERT_TRUE(first->waitFor(1));
    EXPECT_TRUE(client.isListening(name));
    first.reset();
    Listener second(this->loop, this->world.server, name);
    EXPECT_FALSE(client.isListening(name));
    EXPECT_TRUE(client.isListening(name));
    ASSERT_TRUE(this->loop.runUntil([&] { return !hangUps.empty(); }));
    EXPECT_EQ(Send(*client.connect(name), "to the second", true, 10ms), SendStatus::receiveTimeout);
    ASSERT_TRUE(second.waitFor(1));
    EXPECT_EQ(second.text(0), "to the second");
    EXPECT_TRUE(client.isListening(name));
    EXPECT_THAT(hangUps, ElementsAre(name));
}

TYPED_TEST(PortContract, tellsThatAnOwnerWasFoundAndIsGoneWhenConnecting) {
    auto& client = this->world.client;
    int hangUps = 0;
    client.setHangUpHandler([&](const std::string&) { ++hangUps; });
    auto owner = this->world.server.open(name);
    EXPECT_TRUE(client.isListening(name));
    owner.reset();
    EXPECT_EQ(client.connect(name), nullptr);
    EXPECT_EQ(client.connect(name), nullptr);
    owner = this->world.server.open(name);
    EXPECT_FALSE(client.isListening(name));
    EXPECT_TRUE(client.isListening(name));
    this->loop.runPending();
    EXPECT_EQ(hangUps, 1);
}

TYPED_TEST(PortContract, noticesReachEveryObserverOfTheirName) {
    DistributedNotificationCenter& here = this->world.serverNotices;
    DistributedNotificationCenter& there = this->world.clientNotices;
    std::string calls;
    std::vector<std::unique_ptr<Handle>> handles;
    const auto observe = [&](DistributedNotificationCenter& center, const std::string& which, char mark) {
        handles.push_back(center.observe(which, [&calls, mark] { calls += mark; }));
    };
    observe(here, "A", 'a');
    observe(there, "A", 'A');
    observe(there, "B", 'B');
    observe(there, "A", 'x');
    handles.pop_back();
    here.post("A");
    EXPECT_EQ(calls, "");
    ASSERT_TRUE(this->loop.runUntil([&] { return calls.size() == 2; }));
    here.postLocally("A");
    there.postLocally("B");
    this->loop.runPending();
    EXPECT_THAT(calls, testing::AnyOf("aAaB", "AaaB"));
    // An observer that ends another keeps it from being called.
    handles.clear();
    for (int i = 0; i < 2; ++i)
        handles.push_back(here.observe("A", [&] { handles.clear(); }));
    there.post("A");
    EXPECT_TRUE(this->loop.runUntil([&] { return handles.empty(); }));
}
