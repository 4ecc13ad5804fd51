#pragma once

#include <functional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

/// What a desktop entry's "Exec" stands for. Pure functions.
namespace platform {

using Command = std::vector<std::string>;

struct ExecEntry {
    std::string name;
    std::string icon;
    std::string path; ///< of the entry; empty for a bare executable
};

/// The commands that open the documents with the words of an "Exec" whose field codes are still in it: one
/// for each document when the program takes one at a time, or none that it says. A file goes by its path
/// where the program wants paths; what is no file goes by its URL.
std::vector<Command> CommandsOf(std::span<const std::string> exec, const ExecEntry& entry,
                                const std::vector<std::string>& documentURLs);

/// The command in the first terminal that there is; empty when there is none.
Command InTerminal(const Command& command, const std::function<bool(const char*)>& isThere);

/// The command that opens the settings of a desktop ($XDG_CURRENT_DESKTOP, names with colons between) at a
/// page, or as a whole when that is empty. Empty for a desktop that is not known.
Command SettingsCommand(std::string_view currentDesktop, std::string_view pane);

} // namespace platform
