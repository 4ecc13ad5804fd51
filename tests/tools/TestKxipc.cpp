#include "lib/ipc/KXIPCServer.h"
#include "lib/plist/Binary.h"
#include "platform/linux/LinuxPorts.h"
#include "platform/linux/PollMainLoop.h"
#include "platform/linux/ProcProcessTable.h"
#include "tests/support/ScratchHome.h"
#include "tools/kxipcArguments.h"
#include "tools/kxipcRecording.h"
#include "tools/kxipcWatch.h"

#include <atomic>
#include <cmath>
#include <csignal>
#include <gmock/gmock.h>
#include <poll.h>
#include <sstream>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace {

TEST(KxipcArguments, TakesWhatMakesSenseAndRefusesTheRest) {
    std::string error;
    const auto post = KxipcArguments::parse({"post", "--file", "-", "n"}, error);
    EXPECT_EQ(post->command, KxipcArguments::Command::post);
    EXPECT_EQ(post->file, "-");
    EXPECT_THAT(post->names, testing::ElementsAre("n"));
    EXPECT_EQ(KxipcArguments::parse({"listen", "a", "b"}, error)->names.size(), 2U);
    EXPECT_TRUE(KxipcArguments::parse({"watch", "--json"}, error)->json);
    EXPECT_EQ(KxipcArguments::parse({"replay", "f", "--speed", "0.5", "p"}, error)->speed, 0.5);
    const std::vector<std::string> wrong[] = {{},
                                              {"pots"},
                                              {"ports", "a"},
                                              {"post"},
                                              {"post", "a", "b"},
                                              {"post", "a", "--file"},
                                              {"listen", "--file"},
                                              {"watch", "--speed", "1"},
                                              {"record"},
                                              {"replay", "f", "--speed"},
                                              {"replay", "f", "--speed", "-1"},
                                              {"replay", "f", "--speed", "fast"}};
    for (const auto& arguments : wrong)
        EXPECT_FALSE(KxipcArguments::parse(arguments, error).has_value()) << error;
}

TEST(KxipcLine, TellsAnyMessageOnOneLine) {
    std::string error;
    const plist::Value envelope = plist::Dictionary{
        {"message",
         plist::Dictionary{{"name", "n\x1B\n\""},
                           {"userInfo", plist::Dictionary{{"a", plist::Array{-1, UINT64_MAX, 0.5, true, NAN}},
                                                          {"d", plist::Data::copyOf("abc", 3)}}}}},
        {"messageID", 7}};
    platform::PassingMessage message{true, 42, true, 3, plist::WriteBinary(envelope, error).joined()};
    EXPECT_EQ(KxipcLine(message, 1.5, true),
              "{\"seconds\":1.5,\"direction\":\"out\",\"process\":42,\"bytes\":" +
                  std::to_string(message.bytes.size()) +
                  ",\"synchronous\":true,\"missed\":3,\"messageID\":7,\"name\":\"n\\u001b\\u000a\\\"\","
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
    std::stringstream cut(whole.substr(0, whole.size() - 1)), toClients(whole),
        other("rubbish, and long enough");
    EXPECT_EQ(KxipcReadRecording(cut, true)->size(), 1U);
    EXPECT_EQ(KxipcReadRecording(toClients, false)->size(), 1U);
    EXPECT_FALSE(KxipcReadRecording(other, true));
}

/// Real processes on ports in a directory of the test's own.
struct KxipcTest : testing::Test {
    KxipcTest() { setenv("XDG_RUNTIME_DIR", home.path().c_str(), 1); }
    ~KxipcTest() override {
        for (pid_t pid : {server, listener})
            if (pid > 0) end(pid, SIGKILL);
    }

    /// Answers each "ping" by a "pong" that carries the same.
    void startServer() {
        server = fork();
        if (server != 0) return;
        const platform::SystemClock clock;
        platform::PollMainLoop loop(clock);
        platform::ProcProcessTable processes(loop, clock);
        platform::LinuxPorts ports(loop);
        KXIPCContext context{ports.ports(), ports.notifications(), loop, processes, "com.corvane.test"};
        KXIPCServer ipcServer(context);
        const KXIPCObserverEntryRow ping{"ping",
                                         [&](const auto& note) {
                                             ipcServer.postMessage(KXIPCMessage("pong", {}, KXUserInfo(note)),
                                                                   false);
                                         },
                                         {}};
        ipcServer.addEntries(KXIPCObserverEntryArray(&ping, 1), &ipcServer);
        ipcServer.setAllowIncomingMessages(true);
        loop.run();
        _exit(0);
    }
    static int end(pid_t& pid, int signal) {
        int status = 0;
        kill(pid, signal);
        waitpid(std::exchange(pid, 0), &status, 0);
        return status;
    }

    void startListening() { start({"listen", "pong", "KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION"}); }
    void start(std::vector<const char*> arguments) {
        int ends[2];
        ASSERT_EQ(pipe(ends), 0);
        output = ends[0];
        listener = fork();
        if (listener != 0) return void(close(ends[1]));
        dup2(ends[1], STDOUT_FILENO);
        arguments.insert(arguments.begin(), kxipc.c_str());
        arguments.push_back(nullptr);
        execv(kxipc.c_str(), const_cast<char**>(arguments.data()));
        _exit(127);
    }
    /// Waits for the listener to print the text, and forgets what it printed up to there.
    bool prints(const std::string& text) {
        pollfd readable{output, POLLIN, 0};
        char bytes[4096];
        while (printed.find(text) == printed.npos) {
            const auto size = poll(&readable, 1, 20'000) == 1 ? read(output, bytes, sizeof bytes) : 0;
            if (size <= 0) return false;
            printed.append(bytes, static_cast<std::size_t>(size));
        }
        printed.erase(0, printed.find(text) + text.size());
        return true;
    }
    int run(const std::string& arguments) {
        return WEXITSTATUS(
            std::system((kxipc + " " + arguments + " >" + (home.path() / "out").string()).c_str()));
    }

    ScratchHome home;
    std::string kxipc = std::string(std::getenv("KX_TEST_BIN")) + "/kxipc";
    pid_t server = 0, listener = 0;
    int output = -1;
    std::string printed;
};

TEST_F(KxipcTest, FollowsAServerThatIsKilledAndTalksToTheNext) {
    EXPECT_EQ(run("--version"), 0);
    EXPECT_EQ(run("pots 2>/dev/null"), 2);
    EXPECT_EQ(run("post ping 2>/dev/null"), 1) << "no server";
    const auto file = (home.path() / "file").string();
    std::ofstream(file) << "<plist><dict><key>key</key><integer>7</integer></dict></plist>";

    startListening();
    for (int round = 0; round < 3; ++round) {
        startServer();
        ASSERT_TRUE(
            prints("name: KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION\n\n\t\t object: com.corvane.test\n"));
        EXPECT_EQ(run("post ping --file " + file), 0);
        ASSERT_TRUE(prints("name: pong\n\n\t\t object: (null)\n\n\t\t info.key: 7\n"));
        end(server, SIGKILL);
    }
    startServer();
    ASSERT_TRUE(prints("name: KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION\n"));
    EXPECT_EQ(run("post ping --file - <" + file), 0);
    ASSERT_TRUE(prints("info.key: 7\n"));
    EXPECT_EQ(run("post ping --file /dev/null 2>/dev/null"), 1);
    EXPECT_EQ(run("ports"), 0);
    EXPECT_THAT(ScratchHome::contents(home.path() / "out"),
                testing::MatchesRegex("com.corvane.kxipc.[0-9]+.[0-9]+\ncom.corvane.kxipc.server2\n"));
    EXPECT_EQ(end(listener, SIGTERM), 0);
    EXPECT_EQ(ScratchHome::log(), "");
}

TEST_F(KxipcTest, WatchesRecordsAndReplays) {
    const auto file = (home.path() / "file").string(), recording = (home.path() / "recording").string();
    std::ofstream(file) << "<plist><dict><key>key</key><integer>7</integer></dict></plist>";
    EXPECT_EQ(run("watch 2>/dev/null"), 1) << "no server";
    startServer();
    while (run("post ping 2>/dev/null") != 0) {
    }
    start({"record", recording.c_str()});
    while (!std::filesystem::exists(recording) || std::filesystem::file_size(recording) < 200)
        run("post ping --file " + file); // until the recorder is there
    EXPECT_EQ(end(listener, SIGTERM), 0);

    start({"watch", "--json"});
    std::atomic<bool> isSeen = false;
    std::thread poster([&] {
        while (!isSeen)
            run("replay " + recording + " --speed 0");
    });
    EXPECT_TRUE(prints("\"direction\":\"in\""));
    EXPECT_TRUE(prints("\"name\":\"ping\",\"userInfo\":{\"key\":7}}\n"));
    isSeen = true;
    poster.join();
    EXPECT_EQ(run("stats"), 0);
    EXPECT_THAT(ScratchHome::contents(home.path() / "out"),
                testing::MatchesRegex("connections [0-9]+\nreceived [1-9][0-9]*\nsent [0-9]+\nqueued 0\n"
                                      "queuedBytes 0\ndropped 0\n"));
    EXPECT_EQ(run("replay " + file + " 2>/dev/null"), 1);
    end(server, SIGKILL);
    int status = 0;
    waitpid(std::exchange(listener, 0), &status, 0);
    EXPECT_EQ(status, 0) << "a watch ends with what it watches";
}

} // namespace
