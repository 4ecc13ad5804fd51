#include "lib/ipc/KXIPCEnvelope.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCSend.h"
#include "lib/plist/Binary.h"
#include "platform/linux/Backlog.h"
#include "tests/rounds/Program.h"
#include "tests/support/MappedMessages.h"
#include "tests/support/ScratchHome.h"

#include <algorithm>
#include <atomic>
#include <cstring>
#include <endian.h>
#include <thread>
#include <vector>

// Clients that send more than a server can handle; what becomes of that, of the others, and of the server.

namespace {

struct Kind {
    const char* name;
    std::uint32_t count;
    std::size_t size;
    std::uint32_t unanswered; ///< so many are sent at once: as many as a sender keeps
};
constexpr Kind kinds[] = {
    {"small", 1'000'000, 10, 60'000}, {"large", 10'000, 1'000'000, 100}, {"mine", 500, 0, 1}};
constexpr int mine = 2; ///< those of another client, beside the two floods

struct State {
    std::atomic<bool> isServing = false;
    std::array<std::atomic<unsigned>, std::size(kinds)> handled{};
    std::atomic<int> flooding = 2;

    unsigned allHandled() const { return handled[0] + handled[1]; }
};

void serve(const std::string& directory, State& state) {
    Program program(directory);
    KXIPCServer server(program.context);
    for (std::size_t kind = 0; kind < std::size(kinds); ++kind)
        Observe(server, kinds[kind].name, [&handled = state.handled[kind]](const auto&) { ++handled; });
    server.setAllowIncomingMessages(true);
    state.isServing = true;
    program.loop.run();
}

/// Sends one message again and again, faster than it can be written: only its number changes, which must
/// rise, or it is not handled.
void flood(const std::string& directory, State& state, const Kind& kind) {
    Program program(directory);
    constexpr std::uint32_t first = 0x12345678;
    const auto padding = std::make_shared<std::vector<std::byte>>(kind.size);
    const KXIPCMessage message(kind.name, {}, plist::Dictionary{{"x", plist::Data(*padding, padding)}});
    std::string error;
    const auto envelope = KXIPCEnvelope(message, *program.processes.currentProcess(), first, false);
    const auto written = plist::WriteBinary(envelope, error).joined();
    std::vector<std::byte> bytes(written.span().begin(), written.span().end());
    std::uint32_t number = htobe32(first);
    const auto digits = std::as_bytes(std::span(&number, 1));
    auto* const place = &*std::search(bytes.begin(), bytes.end(), digits.begin(), digits.end());
    const std::span<const std::byte> pieces[] = {bytes};
    const auto port = program.system.ports().connect(KX_IPC_ServerPortName());
    for (std::uint32_t i = 1; i <= kind.count; ++i) {
        number = htobe32(first + i);
        std::memcpy(place, &number, sizeof number);
        port->send(pieces, i % kind.unanswered == 0 || i == kind.count,
                   {std::chrono::hours(1), std::chrono::hours(1)});
    }
    --state.flooding;
    pause();
}

TEST(Flood, LosesNothingAndCostsOthersATurnAndTheServerNoMoreThanTheQuota) {
    const ScratchHome home;
    const std::string directory = home.path() / "ports";
    State& state = Shared<State>();
    const Worker server([&] { serve(directory, state); });
    TimeUntil([&] { return state.isServing.load(); });
    const Worker small([&] { flood(directory, state, kinds[0]); });
    const Worker large([&] { flood(directory, state, kinds[1]); });
    TimeUntil([&] { return state.handled[0] > 0 && state.handled[1] > 0; });

    Program program(directory);
    std::vector<unsigned> overtaken; // by count, since time is the machine's
    std::size_t mapped = 0;
    while (overtaken.size() < kinds[mine].count) {
        const auto before = state.allHandled();
        KX_IPC_SendMessageToNamedPort(program.context, KXIPCMessage("mine", {}, {}), KX_IPC_ServerPortName(),
                                      true);
        overtaken.push_back(state.allHandled() - before);
        ASSERT_EQ(state.handled[mine], overtaken.size()) << "answered once it is handled";
        mapped = std::max(mapped, MappedMessages(server.pid()));
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    ASSERT_EQ(state.flooding, 2) << "all of that in the flood";
    while (state.flooding > 0)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    for (std::size_t kind = 0; kind < std::size(kinds); ++kind)
        EXPECT_EQ(state.handled[kind], kinds[kind].count) << kinds[kind].name;
    const auto middle = overtaken.begin() + std::ssize(overtaken) / 2;
    std::ranges::nth_element(overtaken, middle);
    EXPECT_LE(*middle, 80U) << "each flood's quota, and a turn of each";
    EXPECT_LE(mapped, platform::Backlog::ofSender.bytes + 2 * kinds[1].size);
}

} // namespace
