#include "platform/linux/PeerIdentity.h"

#include "platform/ProcessTable.h"
#include "platform/linux/ProcRecords.h"
#include "platform/linux/SmallFile.h"

#include <cstdint>
#include <fcntl.h>
#include <optional>
#include <string>

namespace platform {

std::optional<ProcessSerialNumber> SerialNumberOfPeer(int processID) {
    const auto path = "/proc/" + std::to_string(processID) + "/stat";
    const auto text = ReadSmallFile(AT_FDCWD, path, 4096);
    const auto stat = text ? ParseProcStat(*text) : std::nullopt;
    if (!stat) return std::nullopt;
    return ProcessSerialNumber{static_cast<std::uint32_t>(stat->startTicks),
                               static_cast<std::uint32_t>(processID)};
}

} // namespace platform
