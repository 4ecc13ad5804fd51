#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCSend.h"
#include "platform/linux/Backlog.h"
#include "tests/platform/PortWorlds.h"
#include "tests/rounds/Program.h"
#include "tests/support/MappedMessages.h"

#include <array>
#include <atomic>
#include <vector>

// A server whose main thread hangs: what its senders see of it, what it holds, what it does when it wakes.

namespace {

using namespace std::chrono_literals;

struct State {
    std::atomic<bool> isServing, isHanging, mayWake, haveAllReturned;
    std::atomic<int> ofOther;
    std::atomic<std::size_t> handled;
    std::array<std::atomic<int>, 100> numbers; ///< as they were handled
};

void serve(const std::string& directory, State& state) {
    Program program(directory);
    KXIPCServer server(program.context);
    Observe(server, "hang", [&](const auto&) {
        for (state.isHanging = true; !state.mayWake;)
            std::this_thread::sleep_for(1ms);
    });
    Observe(server, "numbered", [&](const auto& notification) {
        state.numbers.at(state.handled++) = KXUserInfo(notification)["number"].intValue();
    });
    Observe(server, "other", [&](const auto&) { ++state.ofOther; });
    server.setAllowIncomingMessages(true);
    state.isServing = true;
    program.loop.run();
}

void send(KXIPCContext& context, const char* name, int number, std::size_t size, bool synchronous = false) {
    const auto padding = std::make_shared<std::vector<std::byte>>(size);
    const plist::Dictionary info{{"number", number}, {"padding", plist::Data(*padding, padding)}};
    KX_IPC_SendMessageToNamedPort(context, {name, {}, info}, KX_IPC_ServerPortName(), synchronous);
}

constexpr int others = 300;
constexpr std::size_t inlineSize = 200'000, largeSize = std::size_t{8} << 20;

TEST(Hang, CostsTheSendersWhatTheyDropAndTheServerItsQuotas) {
    UnixWorld world;
    State& state = Shared<State>();
    const Worker server([&] { serve(world.directory, state); });
    TimeUntil([&] { return state.isServing.load(); });
    platform::ProcProcessTable processes(world.loop, world.clock);
    KXIPCContext context{world.client, world.clientNotices, world.loop, processes, "com.corvane.test"};
    send(context, "hang", 0, 0);
    TimeUntil([&] { return state.isHanging.load(); });
    const auto before = HeldMemory(server.pid());
    auto held = before;

    const Worker other([&] {
        Program program(world.directory);
        for (int i = 0; i < others; ++i)
            send(program.context, "other", i, inlineSize);
        state.haveAllReturned = true;
        pause();
    });
    TimeUntil([&] { return state.haveAllReturned.load(); });
    int number = 0;
    const auto sendUntil = [&](int end, std::size_t size) {
        for (; number < end; ++number) {
            send(context, "numbered", number, size);
            held = std::max(held, HeldMemory(server.pid()));
        }
    };
    const auto drops = [] { return ScratchHome::logged("dropping messages to "); };
    sendUntil(20, largeSize); // more than the server takes, and the system
    world.clock.advance(1000s - 1ms);
    sendUntil(21, 0);
    EXPECT_EQ(drops(), 0);
    world.clock.advance(1ms);
    sendUntil(22, 0);
    TimeUntil([&] { return drops() == 1; });
    sendUntil(62, largeSize); // more than a sender keeps
    const auto quotas =
        platform::Backlog::ofSender.bytes + largeSize + platform::Backlog::ofSender.messages * inlineSize;
    EXPECT_LE(held - before, quotas) << "the last may be of any size";

    state.mayWake = true;
    send(context, "numbered", number, 0, true);
    TimeUntil([&] { return state.ofOther == others; });
    std::vector<int> starts{0}; // of runs without a gap
    for (std::size_t i = 1; i < state.handled; ++i)
        if (state.numbers[i] != state.numbers[i - 1] + 1) starts.push_back(state.numbers[i]);
    EXPECT_EQ(starts, (std::vector{0, 20, 62})) << "what was overdue is missing, and what was too much";
    EXPECT_GE(state.handled, 8U + 2 + 31 + 1) << "the server's quota, and what a sender keeps";
    EXPECT_EQ(ScratchHome::logged("IPC: "), 1);
}

} // namespace
