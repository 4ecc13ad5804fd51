#pragma once

#include <optional>
#include <string>
#include <vector>

/// What the command line of kxipc asks for.
struct KxipcArguments {
    enum class Command { help, version, ports, listen, post, watch, record, replay, stats };
    Command command = Command::help;
    /// Of messages, to listen for or to post; the file to record or replay, then a port.
    std::vector<std::string> names{};
    std::string file{}; ///< what a posted message carries; "-" is standard input, empty is nothing
    bool json = false;
    double speed = 1; ///< of a replay; 0 is without pauses

    static const char* helpText();
    /// Of the arguments after the program's name. Nothing, and why in `error`, when they make no sense.
    static std::optional<KxipcArguments> parse(const std::vector<std::string>& arguments, std::string& error);
};
