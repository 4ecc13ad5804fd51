// benchSoak PLACE EXCHANGES: a server sends a client menus and waits until each is handled; after every
// hundredth part the client is killed and another connects. Prints a line for each part: exchanges, median
// and 99th percentile of the time in microseconds, resident memory in KiB, descriptors, threads.

#include "bench/ipc/Pair.h"
#include "lib/ipc/KXIPCClient.h"
#include "lib/ipc/KXIPCServer.h"
#include "platform/linux/LinuxPorts.h"
#include "platform/linux/PollMainLoop.h"
#include "platform/linux/ProcProcessTable.h"

#include <filesystem>
#include <fstream>
#include <iostream>

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

void BeClient(const std::string& place) {
    prctl(PR_SET_PDEATHSIG, SIGKILL);
    Program program(place);
    KXIPCClient client(program.context);
    plist::Value last; // an agent keeps the menu that it shows
    const KXIPCObserverEntryRow row{
        "menu.update", [&](const KXNotification& notification) { last = KXUserInfo(notification); }, {}};
    client.addEntries(KXIPCObserverEntryArray(&row, 1), &client);
    client.setAllowIncomingMessages(true);
    program.loop.run();
}

pid_t StartClient(const std::string& place) {
    const auto started = fork();
    if (started == 0) execl("/proc/self/exe", "benchSoak", place.c_str(), nullptr);
    return started;
}

std::size_t CountOf(const char* list) {
    const std::filesystem::directory_iterator files(list);
    return static_cast<std::size_t>(std::distance(begin(files), end(files)));
}

long ResidentMemory() {
    long size = 0, resident = 0;
    std::ifstream("/proc/self/statm") >> size >> resident;
    return resident * 4;
}

} // namespace

int main(int count, char* words[]) {
    if (count < 2) return 2;
    const std::string place = words[1];
    if (count == 2) BeClient(place);
    const int part = std::atoi(words[2]) / 100;
    Program program(place);
    KXIPCServer server(program.context);
    server.setAllowIncomingMessages(true);
    const KXIPCMessage message("menu.update", {}, MenuUpdate(60, listWidth).userInfo);
    for (int done = part; done <= 100 * part; done += part) {
        const auto client = StartClient(place);
        const auto isThere = [&] {
            const auto all = server.clientsForMessage(message);
            return all.size() == 1 && all.front()->pid() == client;
        };
        if (!program.loop.runUntil(isThere, std::chrono::seconds(60))) return 1;
        Times times;
        for (int i = 0; i < part; ++i)
            times.push_back(TimeOf([&] { server.postMessage(message, true); }));
        std::cout << done << ' ' << Median(times) << ' ' << Quantile(times, 0.99) << ' ' << ResidentMemory()
                  << ' ' << CountOf("/proc/self/fd") << ' ' << CountOf("/proc/self/task") << std::endl;
        kill(client, SIGKILL);
        waitpid(client, nullptr, 0);
    }
}
