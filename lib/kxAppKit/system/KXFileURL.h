#pragma once

#include <optional>
#include <string>
#include <string_view>

/// The file URL of a path; nothing when it cannot be the path of a file. Bytes that are no plain characters
/// of a URL are escaped. A path that is not absolute counts from the working directory.
std::optional<std::string> KXFileURLOfPath(std::string_view path);
