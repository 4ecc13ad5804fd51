#pragma once

#include <cstddef>
#include <optional>
#include <string>

namespace platform {

/// What becomes of a link in the last place of a path.
enum class Links { refuse, follow };

/// The first `limit` bytes of a file, read at once; nothing when it cannot be read. Never blocks on what
/// stands in its place. `path` is relative to the open directory, or absolute.
std::optional<std::string> ReadSmallFile(int directory, const std::string& path, std::size_t limit,
                                         Links links = Links::refuse);

} // namespace platform
