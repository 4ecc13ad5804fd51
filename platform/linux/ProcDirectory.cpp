#include "platform/linux/ProcDirectory.h"

#include "lib/base/ParseNumber.h"
#include "platform/linux/ProcRecords.h"
#include "platform/linux/SmallFile.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <dirent.h>
#include <fcntl.h>
#include <linux/limits.h>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

namespace platform {

namespace {

constexpr std::size_t largestRecord = 4096;

int ProcessID(std::string_view name) {
    int pid = 0;
    return ParseNumber(name, pid) ? pid : 0;
}

} // namespace

ProcDirectory::ProcDirectory(const std::string& path)
    : m_directory(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC)) {}

std::vector<ProcDirectory::Entry> ProcDirectory::entries() const {
    std::vector<Entry> entries;
    const auto close = [](DIR* directory) { closedir(directory); };
    const int listing = openat(m_directory.get(), ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    const std::unique_ptr<DIR, decltype(close)> directory(fdopendir(listing), close);
    if (!directory) return entries;
    while (const dirent* entry = readdir(directory.get()))
        if (const int pid = ProcessID(entry->d_name); pid > 0) entries.push_back({pid, entry->d_ino});
    std::ranges::sort(entries, {}, &Entry::pid);
    return entries;
}

bool ProcDirectory::isOfUser(int pid) const {
    struct stat status {};
    return fstatat(m_directory.get(), std::to_string(pid).c_str(), &status, 0) == 0 &&
           status.st_uid == geteuid();
}

std::optional<std::uint64_t> ProcDirectory::ticksSinceBoot() const {
    const auto text = ReadSmallFile(m_directory.get(), "uptime", largestRecord);
    const auto seconds = text ? ParseUptime(*text) : std::nullopt;
    if (!seconds) return {};
    return static_cast<std::uint64_t>(*seconds * static_cast<double>(sysconf(_SC_CLK_TCK)));
}

std::optional<ProcStat> ProcDirectory::stat(int pid) const {
    const auto text = read(pid, "stat");
    const auto stat = text ? ParseProcStat(*text) : std::nullopt;
    return stat && !stat->hasEnded() ? stat : std::nullopt;
}

std::string ProcDirectory::executable(int pid) const {
    std::array<char, PATH_MAX> target{};
    const auto length =
        readlinkat(m_directory.get(), (std::to_string(pid) + "/exe").c_str(), target.data(), target.size());
    std::string_view path(target.data(), length > 0 ? static_cast<std::size_t>(length) : 0);
    // A program that was upgraded while it runs is still that program.
    constexpr std::string_view replaced = " (deleted)";
    if (path.ends_with(replaced)) path.remove_suffix(replaced.size());
    return std::string(path);
}

std::string ProcDirectory::controlGroup(int pid) const {
    return std::string(SystemdControlGroup(read(pid, "cgroup").value_or("")));
}

std::optional<std::string> ProcDirectory::sandboxInfo(int pid) const {
    return read(pid, "root/.flatpak-info");
}

std::optional<std::string> ProcDirectory::read(int pid, const char* file) const {
    return ReadSmallFile(m_directory.get(), std::to_string(pid) + "/" + file, largestRecord);
}

} // namespace platform
