#include "tests/rounds/Program.h"
#include "tests/support/ScratchHome.h"

#include <algorithm>
#include <atomic>
#include <memory>
#include <random>
#include <vector>

// Servers contend for a name, and each that has it is killed.

namespace {

struct State {
    std::atomic<pid_t> owner = 0;
    std::atomic<int> doubles = 0;
};

const std::string name = "com.corvane.kxipc.server2";

/// Takes the name as soon as it can be had, and keeps it. An owner who sees another's mark was robbed: once
/// it is killed it never looks again, and without that it never gives the name up.
void contend(const std::string& directory, State& state) {
    Program program(directory);
    std::unique_ptr<platform::LocalPort> port;
    while (!(port = program.system.ports().open(name)))
        std::this_thread::sleep_for(std::chrono::microseconds(200));
    state.owner = getpid();
    for (;;) {
        if (state.owner != getpid()) ++state.doubles;
        std::this_thread::sleep_for(std::chrono::microseconds(20));
    }
}

void takeOver(int servers, int rounds) {
    const ScratchHome home;
    State& state = Shared<State>();
    const auto start = [&] {
        return std::make_unique<Worker>([&] { contend(home.path() / "ports", state); });
    };
    std::vector<std::unique_ptr<Worker>> workers;
    for (int i = 0; i < servers; ++i)
        workers.push_back(start());

    std::mt19937 random(static_cast<unsigned>(servers));
    TimeUntil([&] { return state.owner != 0; });
    for (int round = 0; round < rounds && !testing::Test::HasFailure(); ++round) {
        std::this_thread::sleep_for(std::chrono::microseconds(random() % 2000));
        const auto owner =
            std::ranges::find(workers, state.owner.load(), [](const auto& worker) { return worker->pid(); });
        ASSERT_NE(owner, workers.end());
        const auto killed = (*owner)->pid();
        kill(killed, SIGKILL);
        TimeUntil([&] { return state.owner != killed; });
        *owner = start();
    }
    EXPECT_EQ(state.doubles, 0);
}

TEST(Takeovers, NeverLeadToTwoOwnersAndSoonToOne) {
    takeOver(2, 500);
    takeOver(8, 500);
}

} // namespace
