#pragma once

#include "platform/linux/Descriptor.h"
#include "platform/linux/ProcRecords.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace platform {

/// What /proc tells of processes, by their id. A process may end, and its id go to another, between any two
/// calls. Any thread.
class ProcDirectory {
public:
    explicit ProcDirectory(const std::string& path);

    struct Entry {
        int pid = 0;
        std::uint64_t number = 0; ///< of the file; another one for another process
    };
    /// By ascending id.
    std::vector<Entry> entries() const;
    /// Not of a process that lets nobody look into it: the kernel gives it to root.
    bool isOfUser(int pid) const;

    std::optional<std::uint64_t> ticksSinceBoot() const;
    std::optional<ProcStat> stat(int pid) const; ///< of a process that has not ended
    std::string executable(int pid) const;       ///< empty when it may not be read
    std::string controlGroup(int pid) const;
    std::optional<std::string> sandboxInfo(int pid) const; ///< the file that a sandbox puts into the root

private:
    std::optional<std::string> read(int pid, const char* file) const;

    Descriptor m_directory;
};

} // namespace platform
