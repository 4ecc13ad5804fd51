#pragma once

#include <cstddef>
#include <span>
#include <string>
#include <string_view>
#include <vector>

/// The two encodings of text that property lists use. What is malformed reads as U+FFFD.
namespace plist::unicode {

inline constexpr char32_t kReplacement = 0xFFFD;

bool isASCII(std::span<const std::byte> bytes);

/// Takes one character off the front of `text`, which must not be empty.
char32_t takeUTF8(std::string_view& text);
/// The same from big-endian UTF-16; `text` holds whole units.
char32_t takeUTF16(std::span<const std::byte>& text);

void appendUTF8(std::string& text, char32_t character);
/// Big-endian.
void appendUTF16(std::vector<std::byte>& text, char32_t character);

} // namespace plist::unicode
