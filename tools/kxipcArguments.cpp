#include "tools/kxipcArguments.h"

#include "lib/base/ParseNumber.h"

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <limits>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace {

using Command = KxipcArguments::Command;

struct Form {
    const char* word;
    Command command;
    std::size_t fewest, most; ///< names
    const char* option;       ///< the one it takes, or null
};

constexpr std::size_t any = std::numeric_limits<std::size_t>::max();
constexpr Form forms[] = {
    {"--help", Command::help, 0, 0, nullptr},   {"--version", Command::version, 0, 0, nullptr},
    {"ports", Command::ports, 0, 0, nullptr},   {"listen", Command::listen, 0, any, nullptr},
    {"post", Command::post, 1, 1, "--file"},    {"watch", Command::watch, 0, 1, "--json"},
    {"record", Command::record, 1, 2, nullptr}, {"replay", Command::replay, 1, 2, "--speed"},
    {"stats", Command::stats, 0, 1, nullptr},
};

bool readSpeed(const std::string& text, double& speed) {
    return ParseNumber(text, speed) && speed >= 0 && speed <= 1e6;
}

/// Takes the option's value, if it has one. False when it makes no sense.
bool readOption(KxipcArguments& result, std::vector<std::string>::const_iterator& at,
                std::vector<std::string>::const_iterator end) {
    if (*at == "--json") return result.json = true;
    const bool isFile = *at == "--file";
    if (++at == end) return false;
    if (!isFile) return readSpeed(*at, result.speed);
    result.file = *at;
    return true;
}

} // namespace

const char* KxipcArguments::helpText() {
    return R"(Usage: kxipc ports
       kxipc listen [NAME...]
       kxipc post NAME [--file FILE]
       kxipc watch [PORT] [--json]
       kxipc record FILE [PORT]
       kxipc replay FILE [PORT] [--speed N]
       kxipc stats [PORT]
       kxipc --help | --version

ports   lists the ports that somebody listens on, one a line.
listen  registers with the server for the messages of these names, those of the start menu by
        default, and prints each until interrupted. Waits for a server when there is none.
post    sends the server a message of that name, with the dictionary that FILE holds (a property
        list, binary or XML; - is standard input).
watch   prints a line for each message that the port's process gets ("in") or sends ("out"): seconds,
        direction, the other process, name, contents. Data is given by its size. PORT is the server's
        unless given, here and below.
record  writes those messages to FILE until interrupted.
replay  sends what FILE holds to the port, N times as fast as it was, 0 without pauses: to the server
        what went to a server, to any other what went to a client. It is sent as kxipc's own.
stats   prints how the port's process is doing: connections, messages, queues.

Exit status: 0 done; 1 failed, for example because there is no server; 2 wrong usage.
)";
}

std::optional<KxipcArguments> KxipcArguments::parse(const std::vector<std::string>& arguments,
                                                    std::string& error) {
    const auto fail = [&](std::string why) {
        error = std::move(why);
        return std::nullopt;
    };
    if (arguments.empty()) return fail("no command");
    const auto* form =
        std::ranges::find_if(forms, [&](const Form& each) { return each.word == arguments[0]; });
    if (form == std::end(forms)) return fail("unknown command '" + arguments[0] + "'");

    KxipcArguments result{form->command};
    for (auto at = arguments.begin() + 1; at != arguments.end(); ++at) {
        if (form->option && *at == form->option) {
            if (!readOption(result, at, arguments.end()))
                return fail(std::string(form->option) + " wants a value that makes sense");
        } else if (at->starts_with("-")) {
            return fail("unknown option '" + *at + "'");
        } else {
            result.names.push_back(*at);
        }
    }
    if (result.names.size() < form->fewest) return fail(std::string(form->word) + " wants a name");
    if (result.names.size() > form->most) return fail("too many arguments");
    return result;
}
