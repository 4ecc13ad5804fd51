#include "lib/plist/Scalars.h"

#include "lib/base/ParseNumber.h"
#include "lib/plist/Value.h"

#include <array>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace plist {

namespace {

constexpr std::string_view kBlanks = " \t\r\n";

std::string_view trimmed(std::string_view text) {
    const std::size_t first = text.find_first_not_of(kBlanks);
    if (first == std::string_view::npos) return {};
    return text.substr(first, text.find_last_not_of(kBlanks) - first + 1);
}

/// Whether one was there.
bool take(std::string_view& text, std::string_view prefix) {
    if (!text.starts_with(prefix)) return false;
    text.remove_prefix(prefix.size());
    return true;
}

constexpr std::string_view kDigitsOf64 = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

/// 0 to 63; more than that for what is no digit of base64.
constexpr auto kDigits64 = [] {
    std::array<unsigned char, 256> digits{};
    digits.fill(0xFF);
    unsigned char next = 0;
    for (const char digit : kDigitsOf64)
        digits[static_cast<unsigned char>(digit)] = next++;
    return digits;
}();

} // namespace

Value integerFromText(std::string_view text) {
    text = trimmed(text);
    const bool negative = take(text, "-");
    if (!negative) take(text, "+");
    const int base = take(text, "0x") || take(text, "0X") ? 16 : 10;
    std::uint64_t number = 0;
    if (!ParseNumber(text, number, base)) return {};
    if (!negative) return number;
    if (number > std::uint64_t{1} << 63) return {};
    return static_cast<std::int64_t>(0 - number);
}

Value realFromText(std::string_view text) {
    text = trimmed(text);
    if (take(text, "+") && text.starts_with('-')) return {};
    double number = 0;
    return ParseNumber(text, number) ? Value(number) : Value();
}

Value dateFromText(std::string_view text) {
    using namespace std::chrono; // NOLINT(google-build-using-namespace): dates read as in the calendar
    constexpr std::string_view kForm = "0000-00-00T00:00:00Z";
    text = trimmed(text);
    if (text.size() != kForm.size()) return {};
    for (std::size_t i = 0; i < kForm.size(); ++i) {
        const bool isDigit = text[i] >= '0' && text[i] <= '9';
        if (kForm[i] == '0' ? !isDigit : text[i] != kForm[i]) return {};
    }
    const auto number = [&](std::size_t at, std::size_t size) {
        int value = 0;
        ParseNumber(text.substr(at, size), value);
        return value;
    };
    const year_month_day day{year(number(0, 4)), month(static_cast<unsigned>(number(5, 2))),
                             std::chrono::day(static_cast<unsigned>(number(8, 2)))};
    if (!day.ok() || number(11, 2) > 23 || number(14, 2) > 59 || number(17, 2) > 60) return {};
    const auto since2001 = sys_days(day) - sys_days(year(2001) / January / 1) + hours(number(11, 2)) +
                           minutes(number(14, 2)) + seconds(number(17, 2));
    return Date{static_cast<double>(duration_cast<seconds>(since2001).count())};
}

Value dataFromText(std::string_view text) {
    auto bytes = std::make_shared<std::vector<std::byte>>();
    bytes->reserve(text.size() / 4 * 3);
    std::uint32_t bits = 0;
    std::size_t digits = 0, padding = 0;
    for (const char character : text) {
        if (kBlanks.find(character) != std::string_view::npos) continue;
        const unsigned char digit = kDigits64[static_cast<unsigned char>(character)];
        if (character == '=')
            ++padding;
        else if (digit > 63 || padding > 0)
            return {};
        bits = bits << 6 | (padding > 0 ? 0u : digit);
        if (++digits % 4 != 0) continue;
        for (const int shift : {16, 8, 0})
            bytes->push_back(static_cast<std::byte>(bits >> shift & 0xFF));
    }
    if (digits % 4 != 0 || padding > 2) return {};
    bytes->resize(bytes->size() - padding);
    return Data(*bytes, bytes);
}

std::string textFromData(std::span<const std::byte> data) {
    std::string text;
    text.reserve((data.size() + 2) / 3 * 4);
    for (std::size_t at = 0; at < data.size(); at += 3) {
        std::uint32_t bits = 0;
        for (std::size_t i = at; i < at + 3; ++i)
            bits = bits << 8 | (i < data.size() ? std::to_integer<std::uint32_t>(data[i]) : 0u);
        for (const int shift : {18, 12, 6, 0})
            text += kDigitsOf64[bits >> shift & 63];
    }
    const std::size_t padding = (3 - data.size() % 3) % 3;
    text.replace(text.size() - padding, padding, padding, '=');
    return text;
}

} // namespace plist
