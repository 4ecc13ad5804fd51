#include "app/SMOptions.h"

#include <algorithm>
#include <iterator>
#include <optional>
#include <span>
#include <string>
#include <string_view>

namespace {

struct Option {
    std::string_view word;
    SMCommand command;
};
constexpr Option options[] = {
    {"--toggle", SMCommand::toggle},   {"--show", SMCommand::show},     {"--hide", SMCommand::hide},
    {"--quit", SMCommand::quit},       {"--doctor", SMCommand::doctor}, {"--help", SMCommand::help},
    {"--version", SMCommand::version},
};

} // namespace

std::optional<SMCommand> SMParseArguments(std::span<const char* const> arguments, std::string& error) {
    if (arguments.empty()) return SMCommand::run;
    const auto* option = std::ranges::find(options, arguments.back(), &Option::word);
    if (option == std::end(options))
        error = "unknown option \"" + std::string(arguments.back()) + "\"";
    else if (arguments.size() > 1)
        error = "more than one option";
    else
        return option->command;
    return std::nullopt;
}

const std::string_view SMHelpText =
    R"(Usage: corvane-tesselStartMenu [option]
Shows the start menu's item in the bar, and the menu when it is clicked. There is one in a session, which the daemon
starts; with an option the program tells that one what to do, and ends.

  --toggle   open the menu, or close it when it is open: for a keyboard shortcut of the desktop
  --show     open the menu; nothing happens when it is open
  --hide     close the menu
  --quit     end the one that runs; its daemon does not start it again
  --doctor   say what was found of all that the menu needs, and what helps where something is missing
  --help, --version

The log is ~/Library/Logs/Corvane Tessel/corvane-tesselStartMenu.log. Exit codes: 0 done, 1 not done (none runs, or
one runs already, or the doctor found a fault), 2 wrong usage.
)";
