#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

/// What the kernel's text files say about a process. Pure functions of the text; nothing when it is
/// malformed.
namespace platform {

struct ProcStat {
    char state = 0;
    int parent = 0;
    std::uint64_t startTicks = 0; ///< since boot

    bool hasEnded() const { return state == 'Z' || state == 'X' || state == 'x'; }
};

std::optional<ProcStat> ParseProcStat(std::string_view text);

/// Seconds since boot.
std::optional<double> ParseUptime(std::string_view text);

/// The systemd control group, of either hierarchy; empty without one.
std::string_view SystemdControlGroup(std::string_view text);

/// The application's id when the control group is, or lies in, the unit of an application.
std::optional<std::string> ApplicationIDOfControlGroup(std::string_view path);

/// Undoes systemd's "\xHH" in a unit's name. What is no such escape stays.
std::string UnescapeUnitName(std::string_view name);

} // namespace platform
