#include "platform/linux/PortLeftovers.h"

#include "lib/base/ParseNumber.h"
#include "platform/ProcessTable.h"
#include "platform/linux/Descriptor.h"
#include "platform/linux/PeerIdentity.h"

#include <cstdint>
#include <dirent.h>
#include <fcntl.h>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <sys/file.h>
#include <unistd.h>
#include <vector>

namespace platform {

namespace {

constexpr std::string_view lockSuffix = ".lock";

/// Takes ".<number>" off the end of a name.
std::optional<std::uint32_t> TakeNumber(std::string_view& name) {
    const auto dot = name.rfind('.');
    if (dot == name.npos) return std::nullopt;
    std::uint32_t number = 0;
    if (!ParseNumber(name.substr(dot + 1), number)) return std::nullopt;
    name = name.substr(0, dot);
    return number;
}

/// The process whose port "….<high>.<low>" is.
std::optional<ProcessSerialNumber> ProcessOfName(std::string_view name) {
    const auto low = TakeNumber(name);
    const auto high = low ? TakeNumber(name) : std::nullopt;
    if (!high) return std::nullopt;
    return ProcessSerialNumber{*high, *low};
}

bool IsLockFree(int directory, const std::string& file) {
    const Descriptor lock(openat(directory, file.c_str(), O_RDWR | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK));
    return lock && flock(lock.get(), LOCK_EX | LOCK_NB) == 0;
}

} // namespace

std::vector<std::string> EntriesOf(int directory) {
    std::vector<std::string> names;
    // A fresh description: duplicates of the kept one would share its position.
    const int fresh = openat(directory, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    const std::unique_ptr<DIR, int (*)(DIR*)> list(fdopendir(fresh), closedir);
    if (!list) return names;
    while (const dirent* entry = readdir(list.get()))
        names.emplace_back(entry->d_name);
    return names;
}

void RemoveLeftovers(int directory) {
    for (const auto& file : EntriesOf(directory)) {
        if (!file.ends_with(lockSuffix)) continue;
        const auto name = file.substr(0, file.size() - lockSuffix.size());
        const auto process = ProcessOfName(name);
        if (!process || SerialNumberOfPeer(static_cast<int>(process->lowLongOfPSN)) == process) continue;
        if (!IsLockFree(directory, file)) continue; // whoever holds it lives, whatever the number says
        unlinkat(directory, ('.' + name).c_str(), 0);
        unlinkat(directory, name.c_str(), 0);
        unlinkat(directory, file.c_str(), 0);
    }
}

} // namespace platform
