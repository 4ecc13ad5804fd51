#include "platform/linux/PlaceFindings.h"

#include "platform/Findings.h"
#include "platform/linux/Descriptor.h"

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <string>
#include <sys/statvfs.h>
#include <sys/syscall.h>
#include <system_error>
#include <unistd.h>

namespace platform {

PlaceFinding LookForWriting(const std::string& path) {
    std::filesystem::path there = path;
    std::error_code ignored;
    while (there.has_relative_path() && !std::filesystem::exists(there, ignored))
        there = there.parent_path();
    if (access(there.c_str(), W_OK) != 0) return {path, std::strerror(errno)};
    struct statvfs volume = {};
    const bool isFull = statvfs(there.c_str(), &volume) == 0 && volume.f_blocks > 0 && volume.f_bavail == 0;
    return {path, isFull ? std::strerror(ENOSPC) : ""};
}

std::string ProcessWatchFault() {
    if (access("/proc/self/stat", R_OK) != 0) return std::string("/proc: ") + std::strerror(errno);
    const Descriptor self(static_cast<int>(syscall(SYS_pidfd_open, getpid(), 0)));
    return self ? "" : std::string("pidfd_open: ") + std::strerror(errno);
}

} // namespace platform
