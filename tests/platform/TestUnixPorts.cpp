#include "platform/linux/PrivateDirectory.h"
#include "tests/platform/Child.h"
#include "tests/platform/PortWorlds.h"
#include "tests/support/RawPeer.h"

#include <future>
#include <gmock/gmock.h>
#include <sys/file.h>
#include <sys/resource.h>
#include <sys/stat.h>

// What only the system's ports do: directories, other processes, queues, and peers that do not play by the
// rules.

using namespace std::chrono_literals;
using namespace platform;
using testing::HasSubstr;

namespace {

const std::string name = "com.example.port";

std::size_t OpenDescriptors() {
    const std::filesystem::directory_iterator list("/proc/self/fd");
    return static_cast<std::size_t>(std::distance(begin(list), end(list)));
}

/// So many messages, or somewhat more; closes the port.
std::vector<std::string> Read(LocalPort& port, std::size_t count) {
    std::vector<std::string> texts;
    port.run([&](std::span<Arrival> arrivals) {
        for (const auto& arrival : arrivals)
            texts.emplace_back(reinterpret_cast<const char*>(arrival.bytes.data()), arrival.bytes.size());
        if (texts.size() >= count) port.close();
    });
    return texts;
}

struct UnixPorts : testing::Test, UnixWorld {};

} // namespace

TEST_F(UnixPorts, useADirectoryThatIsTheUsersAlone) {
    const auto isRefused = [&](const std::string& path) {
        UnixMessagePorts ports(loop, clock, path);
        return !ports.open(name) && !ports.isListening(name) && ports.listeningNames().empty();
    };
    const auto at = [&](const char* file) { return (home.path() / file).string(); };
    std::filesystem::create_directory(at("open"));
    chmod(at("open").c_str(), 0755);
    std::filesystem::create_directory_symlink(directory, at("link"));
    std::ofstream(at("file"));
    for (const char* bad : {"open", "link", "file", "missing/below"})
        EXPECT_TRUE(isRefused(at(bad))) << bad;
    EXPECT_EQ(ScratchHome::logged("refusing to use it"), 3);

    EXPECT_FALSE(isRefused(at(std::string(200, 'd').c_str()))) << "too long for a socket's address";
    struct stat status = {};
    ASSERT_EQ(stat(directory.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0700U);
    const Descriptor cleaner(open(directory.c_str(), O_RDONLY | O_CLOEXEC));
    EXPECT_NE(flock(cleaner.get(), LOCK_EX | LOCK_NB), 0);

    setenv("XDG_RUNTIME_DIR", "/some/where", 1);
    EXPECT_EQ(DefaultPortDirectory(), "/some/where/com.corvane.kxipc");
    setenv("XDG_RUNTIME_DIR", "relative", 1);
    EXPECT_THAT(DefaultPortDirectory(), testing::StartsWith("/"));
    unsetenv("XDG_RUNTIME_DIR");
    EXPECT_THAT(DefaultPortDirectory(), HasSubstr(std::to_string(geteuid())));
}

TEST_F(UnixPorts, refuseNamesThatAreNoFileOfTheirs) {
    for (const std::string bad : {"", ".", "..", ".hidden", "a/b", "/tmp/x", "x.lock", "notices"}) {
        EXPECT_FALSE(server.open(bad)) << bad;
        EXPECT_FALSE(server.connect(bad)) << bad;
    }
    EXPECT_TRUE(server.open(std::string(80, 'n')));
    EXPECT_FALSE(server.open(std::string(81, 'n')));
}

TEST_F(UnixPorts, haveNoNoticesThatSomebodyStartedToPostLongAgo) {
    const std::filesystem::path notices = directory + "/notices";
    for (const char* file : {".1.1", ".2.1", "posted"}) {
        std::ofstream(notices / file);
        if (file != std::string(".2.1"))
            last_write_time(notices / file, std::filesystem::file_time_type::clock::now() - 2min);
    }
    const InotifyNotificationCenter later(loop, directory);
    EXPECT_FALSE(exists(notices / ".1.1"));
    EXPECT_TRUE(exists(notices / ".2.1") && exists(notices / "posted"));
}

TEST_F(UnixPorts, giveANameToTheNextOwnerWhenTheLastWasKilled) {
    const Child owner([&] { std::ignore = server.open(name).release(); });
    EXPECT_FALSE(server.open(name));
    EXPECT_TRUE(client.connect(name));
    owner.end();
    EXPECT_TRUE(std::filesystem::is_socket(directory + '/' + name));
    EXPECT_FALSE(client.isListening(name));
    EXPECT_TRUE(server.open(name));
}

TEST_F(UnixPorts, knowTheSenderAlsoAfterItHasEnded) {
    const auto port = server.open(name);
    Child living([&] { Send(*client.connect(name), "lives"); });
    Child dead([&] { Send(*client.connect(name), "dead"); });
    const auto livingPeer = SerialNumberOfPeer(living.pid());
    dead.end();
    port->run([&, seen = 0](std::span<Arrival> arrivals) mutable {
        const auto& arrival = arrivals.front(); // of two senders
        const bool isDead = arrival.bytes.size() == 4;
        EXPECT_EQ(arrival.sender.processID, isDead ? dead.pid() : living.pid());
        EXPECT_EQ(arrival.sender.serialNumber, isDead ? std::nullopt : livingPeer);
        if (++seen == 2) port->close();
    });
}

TEST_F(UnixPorts, neverBlockAnAsynchronousSenderAndKeepOrderToTheEnd) {
    const auto descriptors = OpenDescriptors();
    {
        auto port = server.open(name);
        std::optional<UnixMessagePorts> sender(std::in_place, loop, clock, directory);
        auto remote = sender->connect(name);
        // Far more than a socket takes, and nobody reads.
        for (int i = 0; i < 2000; ++i)
            ASSERT_EQ(Send(*remote, std::to_string(i) + std::string(i % 50 == 0 ? 300'000 : 2'000, ' ')),
                      SendStatus::success);
        EXPECT_EQ(remote->send({}, true, {10ms, 10ms}), SendStatus::sendTimeout);
        auto reading = std::async(std::launch::async, Read, std::ref(*port), 2501);
        EXPECT_EQ(Send(*remote, "2000 joins the queue", true), SendStatus::success);
        for (int i = 2001; i < 2501; ++i)
            Send(*remote, std::to_string(i) + std::string(2'000, ' '));
        remote.reset();
        sender.reset(); // sends what waits
        const auto texts = reading.get();
        ASSERT_EQ(texts.size(), 2501U);
        for (std::size_t i = 0; i < texts.size(); ++i)
            EXPECT_EQ(std::stoul(texts[i]), i);
    }
    EXPECT_EQ(ScratchHome::logged("dropping messages"), 1) << "for the one that timed out";
    EXPECT_LE(OpenDescriptors(), descriptors);
}

TEST_F(UnixPorts, packTogetherWhatHadToWait) {
    const auto owned = PortNames(directory).take(name);
    const auto remote = client.connect(name);
    const Descriptor receiver(accept4(owned->listener(), nullptr, nullptr, SOCK_CLOEXEC));
    std::size_t sent = 0, largest = 0;
    std::vector<std::size_t> numbers;
    const auto send = [&](std::size_t count) {
        for (; count > 0; --count, ++sent)
            Send(*remote, std::to_string(sent) + std::string(sent % 50 == 49 ? 300'000 : 200, ' '));
    };
    const auto readTo = [&](std::size_t last) {
        pollfd polled{receiver.get(), POLLIN, 0};
        PacketReader reader;
        while ((numbers.empty() || numbers.back() != last) && poll(&polled, 1, 20'000) == 1) {
            ASSERT_EQ(reader.read(receiver.get()), Reading::packet);
            largest = std::max(largest, reader.packet().messages.size());
            for (const auto& message : reader.packet().messages)
                numbers.push_back(std::stoul(reinterpret_cast<const char*>(message.payload.data())));
        }
    };
    send(1);
    EXPECT_EQ(client.queued().waiting, 0U) << "where nothing waits";
    send(2999);
    readTo(2999);
    EXPECT_TRUE(numbers.size() == 3000 && std::ranges::is_sorted(numbers));
    EXPECT_EQ(largest, largestGroup);

    // What is overdue is given up, and what was packed with it, later, is not.
    send(3000);
    clock.advance(15s);
    send(5);
    clock.advance(10s);
    send(1);
    for (int tries = 0; tries < 1000 && client.queued().waiting != 6; ++tries)
        loop.runUntil([] { return false; }, 10ms);
    readTo(6005);
    EXPECT_THAT(std::vector(numbers.end() - 6, numbers.end()),
                testing::ElementsAre(6000, 6001, 6002, 6003, 6004, 6005));
    EXPECT_GE(client.queued().dropped, 1000U);
}

TEST_F(UnixPorts, openAConnectionAnewBeforeTheyDropAMessage) {
    auto first = std::make_unique<Listener>(loop, server, name);
    const auto remote = client.connect(name);
    first.reset();
    Listener second(loop, server, name);
    EXPECT_EQ(Send(*remote, "hello"), SendStatus::success);
    ASSERT_TRUE(second.waitFor(1));
    EXPECT_EQ(second.text(0), "hello");
    second.close();
    EXPECT_EQ(Send(*remote, "nobody"), SendStatus::isInvalid);
}

TEST_F(UnixPorts, cutOffPeersThatSendWhatIsNoPacket) {
    Listener listener(loop, server, name);
    const auto bad = BadPackets(), good = GoodPackets();
    const auto descriptors = OpenDescriptors();
    int entries = 0;
    for (const auto& packet : bad) {
        RawPeer peer(directory, name);
        peer.send(packet);
        EXPECT_TRUE(peer.isCutOff()) << packet.what;
        EXPECT_EQ(ScratchHome::logged("closing the connection of process "), ++entries) << packet.what;
        if (entries % 10 == 0) clock.advance(61s);
    }
    EXPECT_TRUE(listener.arrivals().empty());

    // Who says nothing holds up nobody, and costs no entry, nor does who goes at once.
    RawPeer silent(directory, name), peer(directory, name);
    RawPeer(directory, name);
    for (const auto& packet : good)
        peer.send(packet);
    ASSERT_TRUE(listener.waitFor(18));
    for (std::size_t i = 0; i < listener.arrivals().size(); ++i)
        EXPECT_EQ(listener.text(i), "payload");
    listener.arrivals().clear();
    EXPECT_EQ(ScratchHome::logged("IPC: "), entries);
    EXPECT_LE(OpenDescriptors(), descriptors + 5) << "peers' ends, one of them already closed";
    listener.close();
    EXPECT_TRUE(silent.isCutOff());
}

TEST_F(UnixPorts, takeNoMemoryThatCouldShrinkOrHas) {
    const auto port = server.open(name);
    const auto shrinks = [&](RawPeer& peer, int seals, int later) {
        const auto memory = Memory("payload", seals);
        peer.send({{}, RawHeader({.flags = PacketHeader::inMemory, .payloadLength = 7}), {memory}});
        const bool shrank = ftruncate(memory->get(), 0) == 0;
        return fcntl(memory->get(), F_ADD_SEALS, later) == 0 && shrank;
    };
    RawPeer sealedLate(directory, name), sealed(directory, name);
    EXPECT_TRUE(shrinks(sealedLate, 0, allSeals));
    auto reading = std::async(std::launch::async, Read, std::ref(*port), 1);
    EXPECT_TRUE(sealedLate.isCutOff());
    EXPECT_EQ(ScratchHome::logged("memory that is not sealed or not of the announced size"), 1);
    EXPECT_FALSE(shrinks(sealed, allSeals, 0)) << "so what is there when it is mapped is there to be read";
    EXPECT_EQ(reading.get(), std::vector<std::string>{"payload"});
}

TEST_F(UnixPorts, cutOffWhomTheyHaveNoDescriptorFor) {
    Listener listener(loop, server, name);
    rlimit before = {};
    getrlimit(RLIMIT_NOFILE, &before);
    const rlimit low{std::min<rlim_t>(before.rlim_cur, 256), before.rlim_max};
    setrlimit(RLIMIT_NOFILE, &low);
    std::vector<Descriptor> all;
    do
        all.emplace_back(dup(STDERR_FILENO));
    while (all.back());
    all.pop_back();
    all.pop_back(); // becomes the peer's own
    RawPeer refused(directory, name);
    EXPECT_TRUE(refused.isCutOff());
    all.clear();
    setrlimit(RLIMIT_NOFILE, &before);
    EXPECT_EQ(Send(*client.connect(name), "later"), SendStatus::success);
    EXPECT_TRUE(listener.waitFor(1));
    EXPECT_EQ(ScratchHome::logged("no descriptor left"), 1);
}

TEST_F(UnixPorts, takePacketsFromTheProcessThatConnectedAlone) {
    Listener listener(loop, server, name);
    for (const uid_t user : {geteuid(), uid_t{65534}}) {
        if (user != geteuid() && geteuid() != 0) GTEST_SKIP() << "only root can become another user";
        RawPeer peer(directory, name);
        Child other([&] {
            if (setuid(user) == 0) peer.send(GoodPackets().front());
        });
        EXPECT_TRUE(peer.isCutOff());
    }
    EXPECT_EQ(ScratchHome::logged("sent by another process"), 2);
    EXPECT_TRUE(listener.arrivals().empty());
}

TEST_F(UnixPorts, takeNoConnectionOfAnotherUser) {
    if (geteuid() != 0) GTEST_SKIP() << "only root can become another user";
    const std::string theirs = home.path() / "theirs";
    std::filesystem::permissions(home.path(), std::filesystem::perms::all);
    ASSERT_EQ(seteuid(65534), 0);
    UnixMessagePorts ports(loop, clock, theirs);
    const auto port = ports.open(name);
    ASSERT_TRUE(seteuid(0) == 0 && port);
    auto reading = std::async(std::launch::async, Read, std::ref(*port), 1);
    EXPECT_TRUE(RawPeer(theirs, name).isCutOff());
    port->close();
    EXPECT_TRUE(reading.get().empty());
    EXPECT_EQ(ScratchHome::logged(": another user's\n"), 1);
}

TEST_F(UnixPorts, takeSoManyConnectionsOfAProcessAndNoMore) {
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
