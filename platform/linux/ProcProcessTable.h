#pragma once

#include "platform/Clock.h"
#include "platform/ProcessTable.h"
#include "platform/linux/ApplicationIdentifier.h"
#include "platform/linux/ProcDirectory.h"

#include <atomic>
#include <cstdint>
#include <string>
#include <unordered_map>
#include <vector>

namespace platform {

/// The processes of /proc. A bundle identifier is an application id, a bundle path that of a desktop entry.
class ProcProcessTable final : public ProcessTable {
public:
    struct Places {
        std::string proc = "/proc";
        std::vector<std::string> dataDirectories;    ///< hold "applications"
        std::vector<std::string> programDirectories; ///< where desktop entries' programs are looked for
        static Places fromEnvironment();
    };

    /// The loop and the clock must outlive the table; the loop, every handle too.
    ProcProcessTable(MainLoop& mainLoop, const Clock& clock,
                     const Places& places = Places::fromEnvironment());

    std::optional<ProcessSerialNumber> currentProcess() const override;
    std::optional<ProcessSerialNumber> serialNumberOf(int pid) const override;
    /// Those that started after the walk did may be missing.
    std::optional<ProcessInfo> nextProcess(ProcessSerialNumber after) const override;
    std::optional<ProcessInfo> info(ProcessSerialNumber process) const override;
    bool terminate(ProcessSerialNumber process) override;
    bool kill(ProcessSerialNumber process) override;
    [[nodiscard]] std::unique_ptr<Handle> watchExit(ProcessSerialNumber process,
                                                    std::function<void()> handler) override;

private:
    struct Known {
        ProcStat stat;
        bool isSettled = false;
        ProcessEvidence evidence{};
        std::uint64_t entry = 0; ///< its number, if the program alone tells whether all is as it was; else 0
    };

    Descriptor open(ProcessSerialNumber process) const;
    bool send(ProcessSerialNumber process, int signal) const;
    void startWalk() const;
    std::optional<ProcessInfo> infoOf(ProcDirectory::Entry entry) const;
    ProcessInfo infoOf(int pid, const Known& known) const;
    Known& knowledgeOf(int pid, const ProcStat& stat) const;

    MainLoop& m_mainLoop;
    ProcDirectory m_processes;
    mutable ApplicationIdentifier m_applications;
    /// This process once it was asked for, the id below the start; another's id after a fork.
    mutable std::atomic<std::uint64_t> m_current = 0;
    mutable std::vector<ProcDirectory::Entry> m_walk; ///< the one under way, by ascending id
    mutable std::uint64_t m_walkTicks = 0;
    mutable std::unordered_map<int, Known> m_known; ///< by id, so that a walk reads little of each process
};

} // namespace platform
