#pragma once

#include <cstddef>
#include <optional>
#include <string>

namespace platform {

/// The first `limit` bytes of a file, read at once; nothing when it cannot be read. Never blocks on what
/// stands in its place. `path` is relative to the open directory, or absolute.
enum class Links { refuse, follow }; ///< in the last place of the path
std::optional<std::string> ReadSmallFile(int directory, const std::string& path, std::size_t limit,
                                         Links links = Links::refuse);

} // namespace platform
