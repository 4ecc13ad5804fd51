#include "fuzz/Quiet.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCServer.h"
#include "lib/kxAppKit/system/KXProcess.h"
#include "platform/linux/PollMainLoop.h"
#include "platform/linux/ProcProcessTable.h"
#include "platform/linux/SystemClock.h"
#include "platform/linux/UnixMessagePorts.h"
#include "tests/support/InMemoryNotificationCenter.h"
#include "tests/support/RawPeer.h"

#include <fcntl.h>
#include <filesystem>
#include <unistd.h>
#include <vector>

// From packet to dispatch: a server on a real port, and a peer that sends it any packet with any descriptors.
//
// An input's first byte says how it is sent: its low half the descriptors, bit 4 that a header is put in
// front of it, bit 5 that it is sent twice, bits 6 and 7 how often that is in one packet. "PSNPSNPS" stands
// for the process number that the sender truly has.

namespace {

using platform::PacketHeader;

struct Process {
    Process() {
        std::string path = std::filesystem::temp_directory_path() / "kx-fuzz-XXXXXX";
        directory = mkdtemp(path.data());
        ports.emplace(loop, clock, directory + "/ports");
    }
    ~Process() { std::filesystem::remove_all(directory); }

    std::string directory;
    platform::SystemClock clock;
    platform::PollMainLoop loop{clock};
    platform::ProcProcessTable processes{loop, clock};
    std::optional<platform::UnixMessagePorts> ports;
    InMemoryNotificationNetwork network;
    InMemoryNotificationCenter notices{network, loop};
    KXIPCContext context{*ports, notices, loop, processes, "com.corvane.fuzz"};
};

std::vector<std::shared_ptr<platform::Descriptor>> descriptors(unsigned choice, const std::string& contents) {
    using platform::Descriptor;
    switch (choice) {
    case 0:
        return {};
    case 1:
        return {std::make_shared<Descriptor>(open("/dev/null", O_RDONLY | O_CLOEXEC))};
    case 2:
        return {Memory(contents, allSeals & ~F_SEAL_WRITE)};
    case 3:
        return {Memory(contents + "x", allSeals)};
    default:
        return std::vector(choice < 8 ? choice - 3 : 1, Memory(contents, allSeals));
    }
}

/// Sends one input on a connection of its own, and then a message whose answer, or the end of the connection,
/// tells that the input has been dealt with.
void deliver(Process& process, const std::string& name, unsigned how, const std::string& input) {
    RawPeer peer(process.directory + "/ports", name);
    RawPacket packet{.bytes = input, .descriptors = descriptors(how & 0xF, input)};
    if ((how & 0x10) != 0) {
        PacketHeader header{.payloadLength = input.size()};
        if ((how & 0xF) >= 4) header.flags = PacketHeader::inMemory;
        packet.bytes = RawHeader(header) + ((how & 0xF) >= 4 ? "" : input);
    }
    constexpr std::size_t repeats[] = {1, 2, 16, 17};
    const auto once = packet.bytes;
    for (auto i = repeats[how >> 6 & 3U]; i > 1; --i)
        packet.bytes += once;
    for (unsigned i = 0; i <= (how >> 5 & 1U); ++i)
        peer.trySend(packet);
    peer.trySend({.bytes = RawHeader({.flags = PacketHeader::wantsAnswer})});
    // The input itself may have asked for an answer: its own, or the end, is what is waited for then.
    for (PacketHeader answer{.sequence = 1}; answer.sequence != 0;) {
        while (!peer.hasReply(1)) // what waits to be handled may keep the port from reading on
            process.loop.turn(platform::MainLoop::Milliseconds::zero());
        if (peer.receive(&answer, sizeof answer) <= 0 || (how & 0x10) == 0) break;
    }
}

} // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
    return BeQuiet();
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    static Process process;
    if (size == 0) return 0;
    std::string input(reinterpret_cast<const char*>(data) + 1, size - 1);
    std::string number(8, '\0');
    auto rest = KXNumberFromProcessSerialNumber(*process.processes.currentProcess());
    for (auto at = number.rbegin(); at != number.rend(); ++at, rest >>= 8)
        *at = static_cast<char>(rest & 0xFF);
    for (auto at = input.find("PSNPSNPS"); at != input.npos; at = input.find("PSNPSNPS", at + 8))
        input.replace(at, 8, number);

    KXIPCServer server(process.context);
    const KXIPCObserverEntryRow row{
        "menu.onAction", [](const auto& notification) { ReadAll(KXUserInfo(notification)); }, {}};
    server.addEntries(KXIPCObserverEntryArray(&row, 1), &server);
    server.setAllowIncomingMessages(true);
    deliver(process, server.portName(), data[0], input);
    while (process.loop.turn(platform::MainLoop::Milliseconds::zero())) {
    }
    return 0;
}
