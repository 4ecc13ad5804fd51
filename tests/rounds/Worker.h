#pragma once

#include "platform/linux/LinuxPorts.h"
#include "platform/linux/PollMainLoop.h"
#include "platform/linux/ProcProcessTable.h"

#include <algorithm>
#include <chrono>
#include <csignal>
#include <ctime>
#include <functional>
#include <gtest/gtest.h>
#include <new>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>
#include <vector>

/// What the processes of a test share: a plain structure of atomics.
template <class Contents>
class SharedMemory {
public:
    SharedMemory()
        : m_contents(new (mmap(nullptr, sizeof(Contents), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS,
                               -1, 0)) Contents) {}
    ~SharedMemory() { munmap(m_contents, sizeof(Contents)); }
    SharedMemory(const SharedMemory&) = delete;
    SharedMemory& operator=(const SharedMemory&) = delete;
    Contents* operator->() const { return m_contents; }

private:
    Contents* m_contents;
};

/// A process that works until it is killed. Started by a process of one thread.
class Worker {
public:
    explicit Worker(const std::function<void()>& work)
        : m_pid(fork()) {
        if (m_pid != 0) return;
        prctl(PR_SET_PDEATHSIG, SIGKILL);
        work();
        _exit(1);
    }
    ~Worker() { end(); }
    Worker(const Worker&) = delete;
    Worker& operator=(const Worker&) = delete;

    pid_t pid() const { return m_pid; }
    void end() {
        if (m_pid > 0) kill(m_pid, SIGKILL);
        if (m_pid > 0) waitpid(m_pid, nullptr, 0);
        m_pid = 0;
    }

private:
    pid_t m_pid;
};

/// What takes part in a process of its own.
struct Program {
    platform::SystemClock clock;
    platform::PollMainLoop loop{clock};
    platform::ProcProcessTable processes{loop, clock};
    platform::LinuxPorts system;
    explicit Program(const std::string& directory)
        : system(loop, directory) {}
};

inline void Pause(std::chrono::microseconds time) {
    const timespec rest{time.count() / 1'000'000, time.count() % 1'000'000 * 1000};
    nanosleep(&rest, nullptr);
}

/// How long it took until the condition held, as seen every tenth of a millisecond; gives up after ten
/// seconds.
template <class Condition>
std::chrono::microseconds TimeUntil(const Condition& condition) {
    using Clock = std::chrono::steady_clock;
    const auto start = Clock::now();
    while (!condition()) {
        if (Clock::now() - start > std::chrono::seconds(10)) {
            ADD_FAILURE() << "in vain for ten seconds";
            break;
        }
        Pause(std::chrono::microseconds(100));
    }
    return std::chrono::duration_cast<std::chrono::microseconds>(Clock::now() - start);
}

inline void Report(const char* what, std::vector<std::chrono::microseconds> times) {
    if (times.empty()) return;
    std::ranges::sort(times);
    std::printf("%s: %zu times, median %.1f ms, worst %.1f ms\n", what, times.size(),
                static_cast<double>(times[times.size() / 2].count()) / 1000,
                static_cast<double>(times.back().count()) / 1000);
}
