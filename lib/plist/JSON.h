#pragma once

#include <string>
#include <string_view>

namespace plist {

/// UTF-8 as a string of JSON, with its quotes. Nothing in it controls a terminal; what is malformed becomes
/// U+FFFD.
std::string QuotedJSON(std::string_view text);

} // namespace plist
