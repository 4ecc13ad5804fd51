#include "fuzz/Quiet.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCServer.h"
#include "lib/kxAppKit/system/KXProcess.h"
#include "platform/linux/PollMainLoop.h"
#include "platform/linux/PortPacket.h"
#include "platform/linux/ProcProcessTable.h"
#include "platform/linux/SystemClock.h"
#include "platform/linux/UnixMessagePorts.h"
#include "tests/support/InMemoryNotificationCenter.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <sys/mman.h>
#include <sys/un.h>
#include <unistd.h>
#include <vector>

// From packet to dispatch: a server on a real port, and a peer that sends it any packet with any descriptors.
//
// An input's first byte says how it is sent: its low half the descriptors, bit 4 that a header is put in
// front of it, bit 5 that it is sent twice. "PSNPSNPS" stands for the process number that the sender truly
// has.

namespace {

using platform::Descriptor;
using platform::PacketHeader;

constexpr int allSeals = F_SEAL_SEAL | F_SEAL_SHRINK | F_SEAL_GROW | F_SEAL_WRITE;

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

Descriptor memory(const std::string& contents, int seals) {
    Descriptor made(memfd_create("fuzz", MFD_CLOEXEC | MFD_ALLOW_SEALING));
    if (write(made.get(), contents.data(), contents.size()) < 0) return {};
    fcntl(made.get(), F_ADD_SEALS, seals);
    return made;
}

std::vector<Descriptor> descriptors(unsigned choice, const std::string& contents) {
    std::vector<Descriptor> made;
    if (choice == 0) return made;
    if (choice == 1) made.push_back(Descriptor(open("/dev/null", O_RDONLY | O_CLOEXEC)));
    if (choice == 2) made.push_back(memory(contents, allSeals & ~F_SEAL_WRITE));
    if (choice == 3) made.push_back(memory(contents + "x", allSeals));
    for (unsigned i = 4; i <= choice && choice < 8; ++i)
        made.push_back(memory(contents, allSeals));
    if (choice >= 8) made.push_back(memory(contents, allSeals));
    return made;
}

void transmit(int socket, const std::string& packet, const std::vector<Descriptor>& given) {
    iovec vector{const_cast<char*>(packet.data()), packet.size()};
    msghdr message = {};
    message.msg_iov = &vector;
    message.msg_iovlen = 1;
    std::array<std::byte, CMSG_SPACE(8 * sizeof(int))> control{};
    if (!given.empty()) {
        std::vector<int> numbers;
        for (const auto& descriptor : given)
            numbers.push_back(descriptor.get());
        message.msg_control = control.data();
        message.msg_controllen = CMSG_SPACE(numbers.size() * sizeof(int));
        auto* rights = CMSG_FIRSTHDR(&message);
        *rights = {CMSG_LEN(numbers.size() * sizeof(int)), SOL_SOCKET, SCM_RIGHTS};
        std::memcpy(CMSG_DATA(rights), numbers.data(), numbers.size() * sizeof(int));
    }
    sendmsg(socket, &message, MSG_NOSIGNAL);
}

std::string bytesOf(const PacketHeader& header) {
    return {reinterpret_cast<const char*>(&header), sizeof header};
}

/// Sends one input on a connection of its own, and then a message whose answer, or the end of the connection,
/// tells that the input has been dealt with.
void deliver(Process& process, const std::string& name, unsigned how, const std::string& input) {
    sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    (process.directory + "/ports/" + name).copy(address.sun_path, sizeof address.sun_path - 1);
    const Descriptor socket(::socket(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0));
    if (connect(socket.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) std::abort();
    std::string packet = input;
    if ((how & 0x10) != 0) {
        PacketHeader header{.payloadLength = input.size()};
        if ((how & 0xF) >= 4) header.flags = PacketHeader::inMemory;
        packet = bytesOf(header) + ((how & 0xF) >= 4 ? "" : input);
    }
    for (unsigned i = 0; i <= (how >> 5 & 1U); ++i)
        transmit(socket.get(), packet, descriptors(how & 0xF, input));
    transmit(socket.get(), bytesOf({.flags = PacketHeader::wantsAnswer}), {});
    // The input itself may have asked for an answer: its own, or the end, is what is waited for then.
    for (PacketHeader answer{.sequence = 1}; answer.sequence != 0;)
        if (recv(socket.get(), &answer, sizeof answer, 0) <= 0 || (how & 0x10) == 0) break;
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
