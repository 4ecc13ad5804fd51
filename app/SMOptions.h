#pragma once

#include <optional>
#include <span>
#include <string>
#include <string_view>

/// What the agent's command line asks for. Those from `toggle` to `quit` are for the agent that runs already.
enum class SMCommand { run, toggle, show, hide, quit, doctor, help, version };

/// Nothing, and why in `error`, when the arguments (without the program's name) make no sense.
std::optional<SMCommand> SMParseArguments(std::span<const char* const> arguments, std::string& error);

extern const std::string_view SMHelpText;
