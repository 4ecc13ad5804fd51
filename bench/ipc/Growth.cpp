#include "bench/ipc/Growth.h"

#include "bench/ipc/Pair.h"
#include "lib/ipc/KXIPCClient.h"
#include "lib/ipc/KXIPCServer.h"
#include "platform/linux/LinuxPorts.h"
#include "platform/linux/OutgoingMessage.h"
#include "platform/linux/PollMainLoop.h"
#include "platform/linux/ProcProcessTable.h"

#include <algorithm>
#include <cstring>
#include <string_view>
#include <sys/socket.h>

namespace {

struct Program {
    platform::SystemClock clock;
    platform::PollMainLoop loop{clock};
    platform::ProcProcessTable processes{loop, clock};
    platform::LinuxPorts system;
    KXIPCContext context{system.ports(), system.notifications(), loop, processes, "com.example.bench"};
    explicit Program(const std::string& place)
        : system(loop, place + "/ports") {}
};

KXIPCObserverEntry::Array Entry(KXIPCObserverEntry::Selector selector) {
    const KXIPCObserverEntryRow row{"menu.update", std::move(selector), {}};
    return KXIPCObserverEntryArray(&row, 1);
}

const KXIPCMessage smallMessage("menu.update", {}, plist::Dictionary{{"selectedIndex", 1}});

/// The way there, measured as a whole: there, and a byte back.
double CostBetween(std::size_t size, bool inMemory) {
    int ends[2];
    if (socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, ends) != 0) return 0;
    const int room = 1 << 20; // as much as the system grants
    setsockopt(ends[0], SOL_SOCKET, SO_SNDBUF, &room, sizeof room);
    auto& board = NewBoard();
    const auto read = [&] {
        std::vector<std::byte> buffer(size + 1);
        for (;;) {
            iovec vector{buffer.data(), buffer.size()};
            alignas(cmsghdr) char control[CMSG_SPACE(sizeof(int))];
            msghdr message = {};
            message.msg_iov = &vector;
            message.msg_iovlen = 1;
            message.msg_control = control;
            message.msg_controllen = sizeof control;
            if (recvmsg(ends[1], &message, 0) <= 0) return;
            SharedBytes bytes;
            if (const auto* rights = CMSG_FIRSTHDR(&message)) {
                int memory = -1;
                std::memcpy(&memory, CMSG_DATA(rights), sizeof memory);
                bytes = *platform::MapSealedMemory(platform::Descriptor(memory), size);
            } else {
                bytes = SharedBytes::copyOf(buffer.data(), size);
            }
            for (std::size_t at = 0; at < size; at += 4096)
                board.touched = board.touched + std::to_integer<unsigned>(bytes.data()[at]);
            send(ends[1], "", 1, 0);
        }
    };
    const auto reader = StartProcess(read);
    const std::vector<std::byte> payload(size, std::byte{1});
    const std::span<const std::byte> pieces[] = {payload};
    Times times;
    for (int i = 0; i < 220; ++i) {
        const auto start = Board::now();
        const auto message = platform::OutgoingMessage::make(pieces, false, 0, inMemory ? 0 : SIZE_MAX);
        char answer;
        if (message->send(ends[0]) != platform::Sending::taken) break; // more than the system grants
        recv(ends[0], &answer, 1, 0);
        times.push_back(Board::now() - start);
    }
    kill(reader, SIGKILL);
    return times.size() < 220 ? 0 : Median(times);
}

const Rival& Ours() {
    return *std::ranges::find(Rivals(), std::string_view("ours"), &Rival::name);
}

Payload DataOf(std::size_t bytes) {
    const auto data = std::make_shared<std::vector<std::byte>>(bytes);
    return {plist::Dictionary{{"data", plist::Data(*data, data)}}, {}};
}

Times TimesAmidFloods(const std::string& place, std::size_t floods) {
    Pair pair(Ours(), place);
    for (std::size_t i = 0; i < floods; ++i)
        StartProcess([&] {
            const auto sender = Ours().make(place);
            const auto payload = DataOf(i % 2 == 0 ? 10 : 1'000'000);
            for (;;)
                sender->send(payload, false);
        });
    Times times;
    for (int i = 0; i < 5'000; ++i) {
        if (i == 1'000) times.clear(); // the floods rise
        times.push_back(TimeOf([&] { pair.sender().send(MenuRefresh(55), true); }));
        Rest(300);
    }
    return times;
}

} // namespace

double CostOfSize(const std::string& place, std::size_t bytes) {
    Pair pair(Ours(), place);
    const auto payload = DataOf(bytes);
    Times times;
    for (int i = 0; i < (bytes > 1'000'000 ? 20 : 200); ++i) {
        times.push_back(pair.timeToHandle(payload));
        Rest(100 + static_cast<int>(bytes / 10'000));
    }
    return Median(times);
}

double CostAmidFloods(const std::string& place, std::size_t floods) {
    return Median(TimesAmidFloods(place, floods));
}

double SlowestAmidFloods(const std::string& place, std::size_t floods) {
    return Quantile(TimesAmidFloods(place, floods), 1);
}

double CostOfClients(const std::string& place, std::size_t clients) {
    auto& board = NewBoard();
    for (std::size_t i = 0; i < clients; ++i)
        StartProcess([&] {
            Program program(place);
            KXIPCClient client(program.context);
            client.addEntries(Entry([&](const auto&) { ++board.handled; }), &client);
            client.setAllowIncomingMessages(true);
            program.loop.run();
        });
    Program program(place);
    KXIPCServer server(program.context);
    server.setAllowIncomingMessages(true);
    const auto all = [&] { return server.clientsForMessage(smallMessage).size() == clients; };
    if (!program.loop.runUntil(all, std::chrono::seconds(20))) return 0;
    Times times;
    for (std::uint64_t i = 1; i <= 300; ++i) {
        const auto start = Board::now();
        server.postMessage(smallMessage, false);
        while (board.handled < i * clients)
            Rest(10);
        times.push_back(Board::now() - start);
    }
    return Median(times);
}

double CostOfObservers(const std::string& place, std::size_t observers) {
    Program program(place);
    KXIPCServer server(program.context);
    std::size_t calls = 0;
    const auto entry = Entry([&](const auto&) { ++calls; });
    std::vector<char> tokens(observers);
    for (const auto& token : tokens)
        server.addEntries(entry, &token);
    Times times;
    for (int i = 0; i < 50; ++i)
        times.push_back(TimeOf([&] { server.postMessage(smallMessage, false); }));
    return calls == 50 * observers ? Median(times) : 0;
}

double CostOfInline(const std::string&, std::size_t bytes) {
    return CostBetween(bytes, false);
}

double CostOfMemory(const std::string&, std::size_t bytes) {
    return CostBetween(bytes, true);
}
