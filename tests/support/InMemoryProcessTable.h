#pragma once

#include "platform/ProcessTable.h"

#include <algorithm>
#include <map>
#include <utility>
#include <vector>

/// Processes that a test starts and ends by word. The test itself is process 1000.
class InMemoryProcessTable final : public platform::ProcessTable {
public:
    InMemoryProcessTable() { m_current = start(1000); }

    /// An id that was in use before gets another serial number.
    platform::ProcessSerialNumber start(int pid, std::optional<std::string> bundleIdentifier = {}) {
        platform::ProcessInfo info;
        info.serialNumber.lowLongOfPSN = static_cast<std::uint32_t>(pid);
        info.executablePath = "/usr/bin/" + std::to_string(pid);
        info.isBackgroundOnly = !bundleIdentifier;
        if (bundleIdentifier) info.bundlePath = "/usr/share/applications/" + *bundleIdentifier + ".desktop";
        info.bundleIdentifier = std::move(bundleIdentifier);
        return start(std::move(info));
    }

    platform::ProcessSerialNumber start(platform::ProcessInfo info) {
        const auto process = info.serialNumber = {++m_startTime, info.serialNumber.lowLongOfPSN};
        m_processes[process.lowLongOfPSN] = std::move(info);
        return process;
    }

    /// Calls those that watch it, at once. One that was let go of by then is not called.
    void end(platform::ProcessSerialNumber process) {
        m_processes.erase(process.lowLongOfPSN);
        const auto watches = m_watches;
        for (const auto& each : watches)
            if (const auto watch = each.lock(); watch && watch->process == process)
                std::exchange(watch->handler, [] {})();
    }

    auto watchCount() const {
        return std::ranges::count_if(m_watches, [](const auto& watch) { return !watch.expired(); });
    }

    std::optional<platform::ProcessSerialNumber> currentProcess() const override { return m_current; }
    void setCurrentProcess(std::optional<platform::ProcessSerialNumber> process) { m_current = process; }

    std::optional<platform::ProcessSerialNumber> serialNumberOf(int pid) const override {
        const auto found = m_processes.find(static_cast<std::uint32_t>(pid));
        return found == m_processes.end() ? std::nullopt : std::optional(found->second.serialNumber);
    }

    std::optional<platform::ProcessInfo> nextProcess(platform::ProcessSerialNumber after) const override {
        walks += after == platform::ProcessSerialNumber{};
        const auto found = m_processes.upper_bound(after.lowLongOfPSN);
        return found == m_processes.end() ? std::nullopt : std::optional(found->second);
    }

    std::optional<platform::ProcessInfo> info(platform::ProcessSerialNumber process) const override {
        if (serialNumberOf(static_cast<int>(process.lowLongOfPSN)) != process) return {};
        return m_processes.at(process.lowLongOfPSN);
    }

    mutable int walks = 0; ///< that were begun

    bool terminate(platform::ProcessSerialNumber process) override {
        if (!info(process)) return false;
        end(process);
        return true;
    }
    bool kill(platform::ProcessSerialNumber process) override { return terminate(process); }

    std::unique_ptr<platform::Handle> watchExit(platform::ProcessSerialNumber process,
                                                std::function<void()> handler) override {
        if (!info(process)) return nullptr;
        auto watch = std::make_shared<Watch>(Watch{process, std::move(handler)});
        m_watches.push_back(watch);
        return std::make_unique<WatchHandle>(std::move(watch));
    }

private:
    struct Watch {
        platform::ProcessSerialNumber process;
        std::function<void()> handler;
    };
    struct WatchHandle final : platform::Handle {
        explicit WatchHandle(std::shared_ptr<Watch> one)
            : watch(std::move(one)) {}
        std::shared_ptr<Watch> watch;
    };

    std::map<std::uint32_t, platform::ProcessInfo> m_processes; ///< by id
    std::uint32_t m_startTime = 0;
    std::optional<platform::ProcessSerialNumber> m_current;
    std::vector<std::weak_ptr<Watch>> m_watches;
};
