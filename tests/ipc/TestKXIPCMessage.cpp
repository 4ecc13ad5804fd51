#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCSend.h"
#include "tests/ipc/Peer.h"

#include <limits>

using plist::Dictionary;
using plist::Value;
using testing::ElementsAre;
using testing::IsEmpty;

namespace {

KXIPCObserverEntry::Pointer entry(std::optional<std::string> name, std::optional<std::string> object = {}) {
    return std::make_shared<KXIPCObserverEntry>(std::move(name), std::move(object), nullptr);
}

TEST(KXIPCMessage, PropertyListsHoldOnlyWhatIsThereAndReadBack) {
    const Value full = Dictionary{{"name", "n"}, {"object", "o"}, {"userInfo", Dictionary{{"key", 1}}}};
    EXPECT_EQ(KXIPCMessage::initWithInfo(full).propertyList(), full);
    const Value mistyped = Dictionary{{"name", "n"}, {"object", true}, {"userInfo", "text"}};
    EXPECT_EQ(KXIPCMessage::initWithInfo(mistyped).propertyList(), Value(Dictionary{{"name", "n"}}));
    EXPECT_EQ(KXIPCMessage("n", {}, Dictionary{{"b", 2}, {"a", "text"}}).description(),
              "\t\t name: n\n\n\t\t object: (null)\n\n\t\t info.b: 2\n\n\t\t info.a: text\n");

    EXPECT_EQ(entry("n", "o")->propertyList(), Value(Dictionary{{"name", "n"}, {"object", "o"}}));
    EXPECT_EQ(entry({}, "o")->propertyList(), Value(Dictionary()));
    const auto tableOf = [](Value userInfo) {
        return KXIPCObserverEntry::observerEntryTableFromNotification({"", {}, std::move(userInfo)});
    };
    const auto table =
        tableOf(Dictionary{{KX_IPC_PARAM_MSG_TABLE, plist::Array{entry("n")->propertyList(), 1}}});
    EXPECT_EQ(table.value().at(0)->name(), "n");
    EXPECT_EQ(table.value().at(1)->name(), std::nullopt);
    EXPECT_FALSE(tableOf(Dictionary()));
}

TEST(KXIPCMessage, WildcardIsTheEntrysForAMessageAndTheGivenOnesForAnEntry) {
    const KXIPCObserverEntry::Array table{entry("n"), entry("n", "o"), entry("n", "p"), entry("m"),
                                          entry({})};
    EXPECT_THAT(KXIPCMessage("n", {}, {}).matchesInObserverArray(table), ElementsAre(0));
    EXPECT_THAT(KXIPCMessage("n", "o", {}).matchesInObserverArray(table), ElementsAre(0, 1));
    EXPECT_THAT(KXIPCMessage({}, {}, {}).matchesInObserverArray(table), IsEmpty());
    EXPECT_THAT(entry("n")->matchesInObserverArray(table), ElementsAre(0, 1, 2));
    EXPECT_THAT(entry("n", "o")->matchesInObserverArray(table), ElementsAre(1));
    EXPECT_THAT(entry({})->matchesInObserverArray(table), IsEmpty());
}

TEST(KXIPCEnvelope, IsCheckedForItsFormAndForItsSender) {
    const Value message = Dictionary();
    EXPECT_FALSE(KXIPCCheckEnvelope(Dictionary{{"message", message}, {"psnKey", 1}}, {1, {}}).any());
    const Value wrong[] = {1, Dictionary{{"psnKey", 1}}, Dictionary{{"message", "m"}, {"psnKey", 1}},
                           Dictionary{{"message", message}},
                           Dictionary{{"message", message}, {"psnKey", true}}};
    for (const auto& envelope : wrong)
        EXPECT_TRUE(KXIPCCheckEnvelope(envelope, {1, {}}).error) << envelope.description();

    const platform::ProcessSerialNumber self{7, 42}, reused{8, 42}, stranger{7, 43};
    const auto isFrom = [&](platform::ProcessSerialNumber named, const platform::PortPeer& sender) {
        const auto envelope = KXIPCEnvelope(KXIPCMessage("n", {}, {}), named, 1, false);
        return !KXIPCCheckEnvelope(envelope, sender).isForged;
    };
    EXPECT_TRUE(isFrom(self, {42, self}));
    EXPECT_FALSE(isFrom(reused, {42, self}));
    EXPECT_TRUE(isFrom(reused, {42, {}})) << "of a sender that has ended only the process id is known";
    EXPECT_FALSE(isFrom(stranger, {42, {}}));
}

TEST(KXIPCSend, EverySendUsesUpTheNextNumberWhateverBecomesOfIt) {
    World world;
    Peer sender(world, Peer::client), receiver(world, Peer::server);
    Collector a, b;
    KXIPCMessageReceiver portA(receiver.context, a), portB(receiver.context, b);
    portA.startReceivingWithPortName("a");
    portB.startReceivingWithPortName("b");
    const auto send = [&](const char* port) {
        KX_IPC_SendMessageToNamedPort(sender.context, KXIPCMessage("n", {}, {}), port, false);
    };
    send("a");
    send("nobody");
    EXPECT_EQ(World::logged("IPC: KX_IPC_SendMessageToNamedPort: unable to create port, dropping message\n"),
              1);
    sender.processes.setCurrentProcess({});
    send("a");
    EXPECT_EQ(World::logged("IPC: SerializeMessage: GetCurrentProcess returned error: -600\n"), 1);
    EXPECT_EQ(World::logged("IPC: KX_IPC_SendMessageToNamedPort: unable to serialize data\n"), 1);
    sender.processes.setCurrentProcess(sender.psn);
    send("b");
    ASSERT_TRUE(world.loop.runUntil([&] { return a.noted.size() + b.noted.size() == 2; }));
    EXPECT_EQ(a.last, KXIPCEnvelope(KXIPCMessage("n", {}, {}), sender.psn, 1, false));
    EXPECT_THAT(b.noted, ElementsAre(3));
    sender.context.messageCounter = std::numeric_limits<std::int32_t>::max();
    send("a");
    ASSERT_TRUE(world.loop.runUntil([&] { return a.noted.size() == 2; }));
    EXPECT_EQ(a.noted[1], std::numeric_limits<std::int32_t>::min());
    for (int i = 0; i < 20; ++i)
        send("nobody");
    EXPECT_EQ(World::logged("unable to create port"), 10) << "in a minute";
}

} // namespace
