#include "lib/ipc/KXIPCClient.h"
#include "lib/ipc/KXIPCServer.h"
#include "tests/rounds/Worker.h"
#include "tests/support/ScratchHome.h"

#include <atomic>
#include <filesystem>
#include <fstream>
#include <gmock/gmock.h>
#include <random>
#include <set>
#include <string>

// A server and a client that are killed at random moments, and find each other again by themselves.

namespace {

using Milliseconds = std::chrono::milliseconds;

struct State {
    std::atomic<std::uint64_t> pair = 0; ///< whose ping was answered last: the client's id above the server's
    std::atomic<bool> connected = false; ///< what the client believes
};

std::uint64_t pairOf(pid_t client, pid_t server) {
    return static_cast<std::uint64_t>(client) << 32 | static_cast<std::uint32_t>(server);
}

KXIPCObserverEntry::Array entry(const char* name, KXIPCObserverEntry::Selector selector) {
    const KXIPCObserverEntryRow row{name, std::move(selector), {}};
    return KXIPCObserverEntryArray(&row, 1);
}

/// Answers every ping with what it carried.
void serve(const std::string& directory) {
    Program program(directory);
    KXIPCContext context{program.system.ports(), program.system.notifications(), program.loop,
                         program.processes, "com.corvane.test"};
    KXIPCServer server(context);
    server.addEntries(entry("ping",
                            [&](const auto& note) {
                                server.postMessage(KXIPCMessage("pong", {}, KXUserInfo(note)), false);
                            }),
                      &server);
    server.setAllowIncomingMessages(true);
    program.loop.run();
}

/// Pings every millisecond; now and then with so much that it goes through memory.
void ask(const std::string& directory, const SharedMemory<State>& state) {
    Program program(directory);
    KXIPCContext context{program.system.ports(), program.system.notifications(), program.loop,
                         program.processes, "com.corvane.test"};
    KXIPCClient client(context);
    client.addEntries(entry("pong",
                            [&](const auto& note) {
                                const auto server = client.serverProcess();
                                if (server && server->isValid() &&
                                    KXUserInfo(note)["client"].intValue() == getpid())
                                    state->pair = pairOf(getpid(), server->pid());
                            }),
                      &client);
    client.setAllowIncomingMessages(true);
    const plist::Value large = std::string(200'000, 'x');
    int count = 0;
    const auto timer = program.loop.startTimer(Milliseconds(1), Milliseconds(1), [&] {
        state->connected = client.isConnected();
        plist::Dictionary info{{"client", getpid()}};
        if (++count % 16 == 0) info.set("padding", large);
        client.postMessage(KXIPCMessage("ping", {}, std::move(info)), false);
    });
    program.loop.run();
}

/// What a process holds of the system.
struct Holdings {
    long descriptors = 0, threads = 0, mappedMessages = 0;

    static Holdings of(pid_t pid) {
        const auto proc = "/proc/" + std::to_string(pid);
        const auto count = [&](const char* list) {
            const std::filesystem::directory_iterator files(proc + list);
            return std::distance(begin(files), end(files));
        };
        Holdings held{count("/fd"), count("/task")};
        std::ifstream maps(proc + "/maps");
        for (std::string line; std::getline(maps, line);)
            held.mappedMessages += line.find("/memfd:") != line.npos;
        return held;
    }
    bool within(const Holdings& bound) const {
        return descriptors <= bound.descriptors && threads <= bound.threads &&
               mappedMessages <= bound.mappedMessages;
    }
};

class KillRounds : public testing::Test {
protected:
    enum Victim { theClient, theServer, either };

    KillRounds() { start(theClient), start(theServer), awaitPair(); }

    void start(Victim victim) {
        if (victim == theServer)
            server.emplace([this] { serve(directory); });
        else
            client.emplace([this] { ask(directory, state); });
    }
    std::chrono::microseconds awaitPair() {
        return TimeUntil([&] { return state->pair == pairOf(client->pid(), server->pid()); });
    }
    void run(int rounds, Victim given) {
        for (int round = 0; round < rounds && !HasFailure(); ++round) {
            Pause(std::chrono::microseconds(random() % 20'000));
            const auto victim = given == either ? Victim(random() % 2) : given;
            (victim == theServer ? server : client)->end();
            // Now and then there is no server for a while, and the client must know.
            if (victim == theServer && round % 4 == 0) TimeUntil([&] { return !state->connected; });
            start(victim);
            times.push_back(awaitPair());
        }
    }
    std::set<std::string> files() const {
        std::set<std::string> names;
        for (const auto& file : std::filesystem::directory_iterator(directory))
            names.insert(file.path().filename());
        return names;
    }

    const ScratchHome home;
    const std::string directory = home.path() / "ports";
    const SharedMemory<State> state;
    std::optional<Worker> server, client;
    std::mt19937 random{1};
    std::vector<std::chrono::microseconds> times;
};

TEST_F(KillRounds, ThePairWorksAgainByItselfAndHoldsNoMoreThanBefore) {
    // The worker that sends what had to wait starts when it is needed first, and stays.
    const Holdings flusher{0, 1};
    const auto bound = [&](const Worker& survivor) {
        const auto held = Holdings::of(survivor.pid());
        return Holdings{held.descriptors + flusher.descriptors, held.threads + flusher.threads, 2};
    };
    const auto serverBound = bound(*server);
    run(100, theClient);
    TimeUntil([&] { return Holdings::of(server->pid()).within(serverBound); });

    const auto clientBound = bound(*client);
    run(100, theServer);
    TimeUntil([&] { return Holdings::of(client->pid()).within(clientBound); });

    run(99, either);
    client->end();
    run(1, theClient); // the files of those before go when a port is opened
    EXPECT_EQ(files().size(), 5U) << "two ports, their locks and the notices: "
                                  << testing::PrintToString(files());
    Report("kill -9", times);
    std::ranges::sort(times);
    EXPECT_LT(times[times.size() / 2], Milliseconds(250));
}

} // namespace
