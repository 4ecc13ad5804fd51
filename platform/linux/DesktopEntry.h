#pragma once

#include <map>
#include <optional>
#include <string>
#include <string_view>

/// Reading of desktop entries, as far as it takes to know whose process is whose. Pure functions of the text,
/// which is anybody's.
namespace platform {

/// The entries of a group, values as written. Views into `text`. Lines that are no entry are passed over, and
/// the first of two with one key counts.
std::map<std::string_view, std::string_view> KeyFileGroup(std::string_view text, std::string_view group);

struct DesktopEntry {
    std::string program; ///< a path or a name; empty when the entry names a program that only starts another
    bool noDisplay = false;
};

/// Nothing when the text is no application's entry, or a hidden one's.
std::optional<DesktopEntry> ParseDesktopEntry(std::string_view text);

/// The program of an "Exec" value as written, looked for behind "env" and its variables. Empty when it is
/// malformed or runs what it is told to, as shells do.
std::string ProgramOfExec(std::string_view exec);

} // namespace platform
