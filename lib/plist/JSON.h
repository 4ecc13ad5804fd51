#pragma once

#include <string>
#include <string_view>

namespace plist {

/// The text, which is UTF-8, as a string of JSON, with its quotes.
std::string QuotedJSON(std::string_view text);

} // namespace plist
