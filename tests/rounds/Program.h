#pragma once

#include "lib/ipc/KXIPCServer.h"
#include "platform/linux/LinuxPorts.h"
#include "platform/linux/PollMainLoop.h"
#include "platform/linux/ProcProcessTable.h"
#include "tests/platform/Child.h"

#include <chrono>
#include <functional>
#include <gtest/gtest.h>
#include <new>
#include <sys/mman.h>
#include <thread>

/// What the processes of a test share, until they end: a plain structure of atomics.
template <class Contents>
Contents& Shared() {
    constexpr int access = PROT_READ | PROT_WRITE, kind = MAP_SHARED | MAP_ANONYMOUS;
    return *new (mmap(nullptr, sizeof(Contents), access, kind, -1, 0)) Contents;
}

/// What takes part in a process of its own.
struct Program {
    platform::SystemClock clock;
    platform::PollMainLoop loop{clock};
    platform::ProcProcessTable processes{loop, clock};
    platform::LinuxPorts system;
    KXIPCContext context;
    explicit Program(const std::string& directory)
        : system(loop, directory)
        , context{system.ports(), system.notifications(), loop, processes, "com.corvane.test"} {}
};

inline void Observe(KXIPCCommon& common, const char* name, KXIPCObserverEntry::Selector selector) {
    const KXIPCObserverEntryRow row{name, std::move(selector), {}};
    common.addEntries(KXIPCObserverEntryArray(&row, 1), &common);
}

/// How long it took until the condition held, as seen every tenth of a millisecond; gives up after ten
/// seconds.
inline std::chrono::microseconds TimeUntil(const std::function<bool()>& condition) {
    using Clock = std::chrono::steady_clock;
    const auto start = Clock::now();
    while (!condition()) {
        if (Clock::now() - start > std::chrono::seconds(10)) {
            ADD_FAILURE() << "in vain for ten seconds";
            break;
        }
        std::this_thread::sleep_for(std::chrono::microseconds(100));
    }
    return std::chrono::duration_cast<std::chrono::microseconds>(Clock::now() - start);
}
