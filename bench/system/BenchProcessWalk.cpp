/// benchProcessWalk [PROCESSES]: how long it takes to ask whether an application runs that does not, which
/// looks at every process of the user. Starts as many programs beside those that run already as make up the
/// number, 500 unless told. Prints "job<TAB>figure<TAB>unit" lines.

#include "lib/kxAppKit/system/KXProcess.h"
#include "lib/kxAppKit/system/KXWorkspace.h"
#include "platform/linux/LinuxWorkspace.h"
#include "platform/linux/PollMainLoop.h"
#include "platform/linux/ProcProcessTable.h"
#include "platform/linux/SystemClock.h"

#include <algorithm>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <spawn.h>
#include <string_view>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace {

using Clock = std::chrono::steady_clock;
using Milliseconds = std::chrono::duration<double, std::milli>;

/// Programs of several kinds, some with arguments, that do nothing.
class Crowd {
public:
    explicit Crowd(int count) {
        char sleep[] = "/bin/sleep", tail[] = "/usr/bin/tail", follow[] = "-f", nothing[] = "/dev/null",
             time[] = "600";
        char* commands[][4] = {{sleep, time, nullptr}, {tail, follow, nothing, nullptr}};
        for (int i = 0; i < count; ++i) {
            auto& command = commands[i % 2];
            pid_t pid = 0;
            if (posix_spawn(&pid, command[0], nullptr, nullptr, command, environ) == 0) m_pids.push_back(pid);
        }
    }
    ~Crowd() {
        for (const pid_t pid : m_pids) {
            kill(pid, SIGKILL);
            waitpid(pid, nullptr, 0);
        }
    }

private:
    std::vector<pid_t> m_pids;
};

int countProcesses(platform::ProcessTable& table) {
    int count = 0;
    auto processes = KXProcess::processEnumerator(table);
    while (processes.nextObject())
        ++count;
    return count;
}

Milliseconds timeOfWalk(const KXWorkspace& workspace) {
    const auto start = Clock::now();
    if (workspace.isAppWithBundleIdentifierRunning("com.example.absent")) std::exit(1);
    return Clock::now() - start;
}

void reportMany(const char* job, const KXWorkspace& workspace) {
    std::vector<Milliseconds> times(200);
    std::ranges::generate(times, [&] { return timeOfWalk(workspace); });
    std::ranges::sort(times);
    std::printf("%s, median\t%.3f\tms\n", job, times[times.size() / 2].count());
    std::printf("%s, 99th percentile\t%.3f\tms\n", job, times[times.size() * 99 / 100].count());
}

} // namespace

int main(int argc, char** argv) {
    const int wanted = argc > 1 ? std::atoi(argv[1]) : 500;
    platform::SystemClock clock;
    platform::PollMainLoop loop(clock);
    platform::ProcProcessTable table(loop, clock);
    const Crowd crowd(wanted - countProcesses(table));
    platform::ProcProcessTable fresh(loop, clock);
    platform::LinuxWorkspace desktop(fresh);
    const KXWorkspace workspace(desktop.services());
    std::printf("first walk\t%.3f\tms\n", timeOfWalk(workspace).count());
    reportMany("walk over processes that have just started", workspace);
    // After ten seconds the table takes what it knows of a process for settled.
    std::this_thread::sleep_for(std::chrono::seconds(12));
    timeOfWalk(workspace);
    reportMany("warm walk", workspace);
    std::printf("processes in the walk\t%d\t\n", countProcesses(fresh));
    return 0;
}
