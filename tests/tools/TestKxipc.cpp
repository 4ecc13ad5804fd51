#include "lib/ipc/KXIPCNames.h"
#include "lib/plist/Binary.h"
#include "tests/ipc/Peer.h"
#include "tools/kxipcArguments.h"
#include "tools/kxipcRecording.h"
#include "tools/kxipcWatch.h"

#include <cmath>
#include <gmock/gmock.h>
#include <iterator>
#include <sstream>

namespace {

TEST(KxipcArguments, TakesWhatMakesSenseAndRefusesTheRest) {
    const auto parse = [](const std::string& line) {
        std::istringstream words(line);
        std::string error;
        return KxipcArguments::parse({std::istream_iterator<std::string>(words), {}}, error);
    };
    const auto post = parse("post --file - n");
    EXPECT_EQ(post->command, KxipcArguments::Command::post);
    EXPECT_EQ(post->file, "-");
    EXPECT_THAT(post->names, testing::ElementsAre("n"));
    EXPECT_EQ(parse("listen a b")->names.size(), 2U);
    EXPECT_TRUE(parse("watch --json")->json);
    EXPECT_EQ(parse("replay f --speed 0.5 p")->speed, 0.5);
    for (const char* wrong :
         {"", "pots", "ports a", "post", "post a b", "post a --file", "listen --file", "watch --speed 1",
          "record", "replay f --speed", "replay f --speed -1", "replay f --speed fast"})
        EXPECT_FALSE(parse(wrong)) << wrong;
}

TEST(KxipcLine, TellsAnyMessageOnOneLine) {
    std::string error;
    const plist::Value envelope = plist::Dictionary{
        {"message",
         plist::Dictionary{{"name", "n\x1B\n\"\xC2\x9B\xFF"},
                           {"userInfo", plist::Dictionary{{"a", plist::Array{-1, UINT64_MAX, 0.5, true, NAN}},
                                                          {"d", plist::Data::copyOf("abc", 3)}}}}},
        {"messageID", 7}};
    platform::PassingMessage message{true, 42, true, 3, plist::WriteBinary(envelope, error).joined()};
    EXPECT_EQ(KxipcLine(message, 1.5, true),
              "{\"seconds\":1.5,\"direction\":\"out\",\"process\":42,\"bytes\":" +
                  std::to_string(message.bytes.size()) +
                  ",\"synchronous\":true,\"missed\":3,\"messageID\":7,\"name\":"
                  "\"n\\u001b\\u000a\\\"\\u009b\xEF\xBF\xBD\","
                  "\"userInfo\":{\"a\":[-1,18446744073709551615,0.5,true,null],\"d\":\"<3 bytes>\"}}\n");
    EXPECT_THAT(KxipcLine(message, 1.5, false),
                testing::AllOf(testing::StartsWith("(3 messages missed)\n"), testing::HasSubstr("1.500 out"),
                               testing::Not(testing::HasSubstr("\x1B"))));
    message.bytes = {};
    EXPECT_THAT(KxipcLine(message, 0, true), testing::HasSubstr("\"error\":"));
}

TEST(KxipcRecording, ReadsWhatItWroteAndNothingElse) {
    std::string error;
    std::stringstream file;
    KxipcStartRecording(file, "com.corvane.kxipc.1.2");
    for (const bool outgoing : {true, false, true}) {
        const plist::Value envelope =
            plist::Dictionary{{"message", plist::Dictionary{{"name", outgoing ? "up" : "down"}}}};
        KxipcRecord(file, {outgoing, 1, outgoing, 0, plist::WriteBinary(envelope, error).joined()}, 2);
    }
    const auto whole = file.str();
    const auto toServer = KxipcReadRecording(file, true);
    ASSERT_EQ(toServer->size(), 2U);
    EXPECT_EQ(toServer->front().message.name(), "up");
    std::stringstream cut(whole.substr(0, whole.size() - 1)), clients(whole), other("rubbish, long enough");
    EXPECT_EQ(KxipcReadRecording(cut, true)->size(), 1U);
    EXPECT_EQ(KxipcReadRecording(clients, false)->size(), 1U);
    EXPECT_FALSE(KxipcReadRecording(other, true));
}

TEST(KxipcReplay, SendsAsItselfAtTheTimesOfTheRecording) {
    World world;
    Peer peer(world, Peer::client), owner(world, Peer::server);
    Collector told;
    KXIPCMessageReceiver receiver(owner.context, told);
    receiver.startReceivingWithPortName("p");
    const KXIPCMessage message("n", {}, plist::Dictionary{{KX_IPC_PARAM_PSN, 7}});
    bool isOver = false;
    KxipcReplay replay(peer.context, {{1, message, false}, {4, message, false}, {NAN, message, false}}, "p",
                       [&] { isOver = true; });
    replay.start(2);
    world.loop.advance(std::chrono::milliseconds(1499));
    EXPECT_EQ(peer.context.messageCounter, 1);
    peer.ports.queue.waiting = 1;
    world.loop.advance(std::chrono::milliseconds(100));
    EXPECT_EQ(peer.context.messageCounter, 1) << "the first still waits for its receiver";
    peer.ports.queue.waiting = 0;
    world.loop.advance(std::chrono::milliseconds(1));
    ASSERT_TRUE(isOver && world.loop.runUntil([&] { return told.noted.size() == 3; }));
    EXPECT_THAT(told.noted, testing::ElementsAre(1, 2, 3));
    EXPECT_EQ(told.last["psnKey"], peer.number());
    EXPECT_EQ(told.last["message"]["userInfo"][KX_IPC_PARAM_PSN], peer.number());
}

} // namespace
