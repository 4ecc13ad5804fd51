#pragma once

#include "platform/linux/Descriptor.h"
#include "platform/linux/ProcRecords.h"

#include <optional>
#include <string>
#include <vector>

namespace platform {

/// What /proc tells of processes, by their id. A process may end, and its id go to another, between any two
/// calls. Any thread.
class ProcDirectory {
public:
    explicit ProcDirectory(const std::string& path);

    /// Ascending. Left out are the processes that let nobody look into them, which the kernel gives to root.
    std::vector<int> processesOfUser() const;

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
