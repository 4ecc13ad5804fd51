#pragma once

#include <charconv>
#include <string_view>
#include <system_error>

/// Reads a number that is the whole of the text, spelled as std::from_chars takes it (the same for every
/// locale). False for anything else.
template <class Number, class... Format>
bool ParseNumber(std::string_view text, Number& number, Format... format) {
    const char* const end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, number, format...);
    return error == std::errc() && stop == end;
}
