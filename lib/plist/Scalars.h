#pragma once

#include "lib/plist/Value.h"

#include <cstddef>
#include <span>
#include <string>
#include <string_view>

/// Scalars as text, as the XML form spells them. White space around is ignored; nil is what the text does not
/// spell.
namespace plist {

Value integerFromText(std::string_view text); ///< decimal or 0x hexadecimal, from -2^63 to 2^64 - 1
Value realFromText(std::string_view text);
Value dateFromText(std::string_view text);                 ///< 2001-01-01T00:00:00Z
Value dataFromText(std::string_view text);                 ///< base64, white space anywhere
std::string textFromData(std::span<const std::byte> data); ///< base64 without white space

} // namespace plist
