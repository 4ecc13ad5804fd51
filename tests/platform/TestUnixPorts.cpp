#include "platform/linux/PrivateDirectory.h"
#include "tests/platform/PortWorlds.h"
#include "tests/platform/RawPeer.h"

#include <gmock/gmock.h>

#include <csignal>
#include <sys/stat.h>
#include <sys/wait.h>

// What only the system's ports do: directories, other processes, queues, and peers that do not play by the
// rules.

using namespace std::chrono_literals;
using namespace platform;
using testing::HasSubstr;

namespace {

const std::string name = "com.example.port";

/// A process that does what it is told, and then waits to be killed.
class Child {
public:
    explicit Child(const std::function<void()>& work) {
        int ready[2];
        if (pipe(ready) != 0) throw std::runtime_error("no pipe");
        m_pid = fork();
        if (m_pid == 0) {
            work();
            if (write(ready[1], "", 1) == 1) pause();
            _exit(0);
        }
        char byte;
        ::close(ready[1]);
        EXPECT_EQ(read(ready[0], &byte, 1), 1);
        ::close(ready[0]);
    }
    ~Child() { end(); }
    void end() {
        if (m_pid > 0) kill(m_pid, SIGKILL);
        if (m_pid > 0) waitpid(m_pid, nullptr, 0);
        m_pid = 0;
    }
    int pid() const { return m_pid; }

private:
    int m_pid;
};

std::size_t OpenDescriptors() {
    const std::filesystem::directory_iterator list("/proc/self/fd");
    return static_cast<std::size_t>(std::distance(begin(list), end(list)));
}

class UnixPorts : public testing::Test {
protected:
    UnixWorld world;
};

} // namespace

TEST_F(UnixPorts, useADirectoryThatIsTheUsersAlone) {
    const auto isRefused = [&](const std::string& directory) {
        UnixMessagePorts ports(world.loop, world.clock, directory);
        return !ports.open(name) && !ports.isListening(name) && ports.listeningNames().empty();
    };
    const auto at = [&](const char* file) { return (world.home.path() / file).string(); };
    std::filesystem::create_directory(at("open"));
    chmod(at("open").c_str(), 0755);
    std::filesystem::create_directory_symlink(world.directory, at("link"));
    std::ofstream(at("file"));
    EXPECT_TRUE(isRefused(at("open")));
    EXPECT_TRUE(isRefused(at("link")));
    EXPECT_TRUE(isRefused(at("file")));
    EXPECT_TRUE(isRefused(at("missing/below")));
    EXPECT_EQ(ScratchHome::logged("refusing to use it"), 3);

    EXPECT_FALSE(isRefused(at(std::string(200, 'd').c_str()))) << "too long for a socket's address";
    struct stat status = {};
    ASSERT_EQ(stat(world.directory.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0700U);

    setenv("XDG_RUNTIME_DIR", "/some/where", 1);
    EXPECT_EQ(DefaultPortDirectory(), "/some/where/com.corvane.kxipc");
    setenv("XDG_RUNTIME_DIR", "relative", 1);
    EXPECT_THAT(DefaultPortDirectory(), testing::StartsWith("/"));
    unsetenv("XDG_RUNTIME_DIR");
    EXPECT_THAT(DefaultPortDirectory(), HasSubstr(std::to_string(geteuid())));
}

TEST_F(UnixPorts, refuseNamesThatAreNoFileOfTheirs) {
    for (const std::string bad : {"", ".", "..", ".hidden", "a/b", "/tmp/x", "x.lock", "notices"}) {
        EXPECT_FALSE(world.server.open(bad)) << bad;
        EXPECT_FALSE(world.server.connect(bad)) << bad;
    }
    EXPECT_TRUE(world.server.open(std::string(80, 'n')));
    EXPECT_FALSE(world.server.open(std::string(81, 'n')));
}

TEST_F(UnixPorts, giveANameToTheNextOwnerWhenTheLastWasKilled) {
    for (int round = 0; round < 5; ++round) {
        LocalPort* forever = nullptr;
        Child owner([&] { forever = world.server.open(name).release(); });
        EXPECT_FALSE(world.server.open(name));
        EXPECT_TRUE(world.client.connect(name));
        owner.end();
        EXPECT_TRUE(std::filesystem::is_socket(world.directory + '/' + name));
        EXPECT_FALSE(world.client.isListening(name));
        EXPECT_TRUE(world.server.open(name));
    }
}

TEST_F(UnixPorts, knowTheSenderAlsoAfterItHasEnded) {
    const auto port = world.server.open(name);
    Child living([&] { Send(*world.client.connect(name), "lives"); });
    Child dead([&] { Send(*world.client.connect(name), "dead"); });
    const auto livingPeer = SerialNumberOfPeer(living.pid());
    const int deadPid = dead.pid();
    dead.end();
    std::thread runner([&] {
        port->run([&, seen = 0](const std::vector<Arrival>& arrivals) mutable {
            const auto& arrival = arrivals.front(); // of two senders
            const bool isDead = arrival.bytes.size() == 4;
            EXPECT_EQ(arrival.sender.processID, isDead ? deadPid : living.pid());
            EXPECT_EQ(arrival.sender.serialNumber, isDead ? std::nullopt : livingPeer);
            if (++seen == 2) port->close();
        });
    });
    runner.join();
}

TEST_F(UnixPorts, neverBlockAnAsynchronousSenderAndKeepOrder) {
    const auto descriptors = OpenDescriptors();
    {
        auto port = world.server.open(name);
        const auto remote = world.client.connect(name);
        // Far more than a socket takes, and nobody reads.
        for (int i = 0; i < 2000; ++i)
            ASSERT_EQ(Send(*remote, std::to_string(i) + std::string(i % 50 == 0 ? 200'000 : 2'000, ' ')),
                      SendStatus::success);
        EXPECT_EQ(remote->send({}, true, {10ms, 10ms}), SendStatus::sendTimeout);
        std::vector<int> numbers;
        std::thread runner([&] {
            port->run([&](const std::vector<Arrival>& arrivals) {
                for (const auto& arrival : arrivals)
                    numbers.push_back(std::atoi(reinterpret_cast<const char*>(arrival.bytes.data())));
                if (numbers.size() == 2001) port->close();
            });
        });
        EXPECT_EQ(Send(*remote, "2000 joins the queue", true), SendStatus::success);
        runner.join();
        ASSERT_EQ(numbers.size(), 2001U);
        EXPECT_TRUE(std::ranges::is_sorted(numbers));
        EXPECT_EQ(numbers.back(), 2000);
        world.loop.runPending();
    }
    EXPECT_EQ(ScratchHome::logged("dropping messages"), 1) << "for the one that timed out";
    EXPECT_LE(OpenDescriptors(), descriptors + 1) << "one for the sender's thread";
}

TEST_F(UnixPorts, dropAtTheSenderWhatIsOverdueAndSayItOnce) {
    const auto port = world.server.open(name);
    const auto remote = world.client.connect(name);
    const auto flood = [&] {
        for (int i = 0; i < 100; ++i)
            Send(*remote, std::string(10'000, 'x'));
    };
    flood();
    world.clock.advance(21s);
    flood();
    world.clock.advance(21s);
    Send(*remote, "x");
    EXPECT_EQ(ScratchHome::logged("dropping messages to " + name), 1);
}

TEST_F(UnixPorts, sendWhatIsQueuedBeforeTheyEnd) {
    std::optional<UnixMessagePorts> sender(std::in_place, world.loop, world.clock, world.directory);
    const auto port = world.server.open(name);
    for (int i = 0; i < 500; ++i)
        Send(*sender->connect(name), std::string(5'000, 'x'));
    int count = 0;
    std::thread runner([&] {
        port->run([&](const std::vector<Arrival>& arrivals) {
            count += static_cast<int>(arrivals.size());
            if (count == 500) port->close();
        });
    });
    sender.reset();
    runner.join();
    EXPECT_EQ(count, 500);
}

TEST_F(UnixPorts, openAConnectionAnewBeforeTheyDropAMessage) {
    auto first = std::make_unique<Listener>(world.loop, world.server, name);
    const auto remote = world.client.connect(name);
    first.reset();
    Listener second(world.loop, world.server, name);
    EXPECT_EQ(Send(*remote, "hello"), SendStatus::success);
    ASSERT_TRUE(second.waitFor(1));
    EXPECT_EQ(second.text(0), "hello");
    second.close();
    EXPECT_EQ(Send(*remote, "nobody"), SendStatus::isInvalid);
}

TEST_F(UnixPorts, cutOffPeersThatSendWhatIsNoPacket) {
    Listener listener(world.loop, world.server, name);
    const auto bad = BadPackets();
    const auto descriptors = OpenDescriptors();
    int entries = 0;
    for (const auto& packet : bad) {
        RawPeer peer(world.directory, name);
        peer.send(packet);
        EXPECT_TRUE(peer.isCutOff()) << packet.what;
        EXPECT_EQ(ScratchHome::logged("closing the connection of process "), ++entries) << packet.what;
        if (entries % 10 == 0) world.clock.advance(61s);
    }
    EXPECT_TRUE(listener.arrivals().empty());

    RawPeer peer(world.directory, name);
    for (const auto& packet : GoodPackets())
        peer.send(packet);
    ASSERT_TRUE(listener.waitFor(GoodPackets().size()));
    for (std::size_t i = 0; i < GoodPackets().size(); ++i)
        EXPECT_EQ(listener.text(i), "payload");
    listener.arrivals().clear();
    EXPECT_LE(OpenDescriptors(), descriptors + 2) << "the last peer's two ends";
}

TEST_F(UnixPorts, takePacketsFromTheProcessThatConnectedAlone) {
    Listener listener(world.loop, world.server, name);
    for (const uid_t user : {geteuid(), uid_t{65534}}) {
        if (user != geteuid() && geteuid() != 0) GTEST_SKIP() << "only root can become another user";
        RawPeer peer(world.directory, name);
        Child other([&] {
            if (setuid(user) == 0) peer.send(GoodPackets().front());
        });
        EXPECT_TRUE(peer.isCutOff());
    }
    EXPECT_EQ(ScratchHome::logged("sent by another process"), 2);
    EXPECT_TRUE(listener.arrivals().empty());
}
