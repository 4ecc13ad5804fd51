#include "server/Options.h"

#include "lib/base/ParseNumber.h"

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <optional>
#include <span>
#include <string_view>

namespace tessel {
namespace {

struct Flag {
    std::string_view name;
    bool Options::*field;
    bool value;
};
constexpr Flag flags[] = {
    {"--help", &Options::help, true},
    {"--version", &Options::version, true},
    {"--no-agent", &Options::startAgent, false},
    {"--show", &Options::show, true},
};

bool ReadIndex(std::string_view text, Options& options) {
    return ParseNumber(text, options.select.emplace());
}

bool ReadRecord(std::string_view text, Options& options) {
    options.record = text;
    return !text.empty();
}

bool ReadMachine(std::string_view text, Options& options) {
    options.machine.emplace(text);
    return !text.empty();
}

struct Setting {
    std::string_view name;
    bool (*read)(std::string_view text, Options& options);
};
constexpr Setting settings[] = {
    {"--record", ReadRecord},
    {"--machine", ReadMachine},
    {"--select", ReadIndex},
};

} // namespace

std::optional<Options> ParseOptions(std::span<const char* const> arguments, std::string& error) {
    Options options;
    for (std::size_t i = 0; i < arguments.size(); ++i) {
        const std::string_view name = arguments[i];
        const auto flag = std::ranges::find(flags, name, &Flag::name);
        const auto setting = std::ranges::find(settings, name, &Setting::name);
        if (flag != std::end(flags)) {
            options.*flag->field = flag->value;
        } else if (setting == std::end(settings)) {
            error = "unknown option \"" + std::string(name) + "\"";
            return std::nullopt;
        } else if (++i == arguments.size() || !setting->read(arguments[i], options)) {
            error = std::string(name) + " needs a value";
            return std::nullopt;
        }
    }
    return options;
}

const std::string_view helpText =
    R"(Usage: tesselDaemon [options]
Knows the machines and their applications, serves them to the start menu, and starts what is chosen there.

  --machine NAME  show this machine first ("host" is this computer, "sample" the guest that ships with us)
  --select N      the same by its place in the list, counted from 0
  --no-agent      do not start the start-menu agent
  --show          open the menu as soon as the agent is there
  --record FILE   append a line to FILE for every message and every launch
  --help, --version

The sample guest has nothing behind it: what is chosen there goes to the log and the record, and starts nothing.
The log is ~/Library/Logs/Corvane Tessel/tesselDaemon.log. Exit codes: 0 ended as asked, 1 could not run (another
daemon serves already), 2 wrong usage.
)";

} // namespace tessel
