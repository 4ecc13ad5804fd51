#pragma once

#include <optional>
#include <span>
#include <string>
#include <string_view>

namespace tessel {

/// What the command line asks for.
struct Options {
    bool help = false;
    bool version = false;
    bool startAgent = true;
    bool show = false;
    std::string record;                 ///< path; empty for none
    std::optional<std::string> machine; ///< a machine's id or name
    std::optional<std::size_t> select;  ///< a machine's index
};

/// Nothing, and why in `error`, when the arguments (without the program's name) make no sense.
std::optional<Options> ParseOptions(std::span<const char* const> arguments, std::string& error);

extern const std::string_view helpText;

} // namespace tessel
