#include "lib/plist/Value.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <chrono>
#include <cmath>
#include <cstddef>
#include <cstdio>
#include <string>
#include <string_view>
#include <utility>

namespace plist {

namespace {

constexpr std::size_t kDeepest = 32;
constexpr std::size_t kLongest = std::size_t{64} << 10;
constexpr std::size_t kDataShown = 32;

std::string describeReal(double number) {
    std::array<char, 32> buffer{};
    const auto end = std::to_chars(buffer.data(), buffer.data() + buffer.size(), number).ptr;
    return {buffer.data(), end};
}

std::string describeDate(Date date) {
    using namespace std::chrono; // NOLINT(google-build-using-namespace): dates read as in the calendar
    constexpr double kCalendarEnds = 9e11; // about 30,000 years either way, what the calendar types can hold
    if (!(std::abs(date.secondsSince2001) < kCalendarEnds)) return describeReal(date.secondsSince2001);
    constexpr sys_days kEpoch = year{2001} / January / 1;
    const auto time = kEpoch + seconds(static_cast<long long>(std::floor(date.secondsSince2001)));
    const auto day = floor<days>(time);
    const year_month_day calendar(day);
    const hh_mm_ss clock(time - day);
    std::array<char, 64> buffer{};
    std::snprintf(buffer.data(), buffer.size(), "%04d-%02u-%02u %02d:%02d:%02d +0000", int{calendar.year()},
                  unsigned{calendar.month()}, unsigned{calendar.day()},
                  static_cast<int>(clock.hours().count()), static_cast<int>(clock.minutes().count()),
                  static_cast<int>(clock.seconds().count()));
    return buffer.data();
}

std::string describeData(const Data& data) {
    std::string text = "<";
    for (std::size_t i = 0; i < std::min(data.size(), kDataShown); ++i) {
        if (i > 0 && i % 4 == 0) text += ' ';
        constexpr std::string_view kDigits = "0123456789abcdef";
        text += kDigits[std::to_integer<std::size_t>(data.data()[i] >> 4)];
        text += kDigits[std::to_integer<std::size_t>(data.data()[i] & std::byte{0xF})];
    }
    if (data.size() > kDataShown) text += " ... " + std::to_string(data.size()) + " bytes";
    return text + ">";
}

std::string quoted(std::string_view text) {
    const auto plain = [](unsigned char c) { return (c | 0x20) >= 'a' && (c | 0x20) <= 'z'; };
    const auto word = [&](unsigned char c) {
        return plain(c) || (c >= '0' && c <= '9') || c == '_' || c == '.';
    };
    if (!text.empty() && std::ranges::all_of(text, word)) return std::string(text);
    std::string result = "\"";
    for (const char c : text) {
        if (c == '"' || c == '\\') result += '\\';
        if (c == '\n')
            result += "\\n";
        else
            result += c;
    }
    return result + '"';
}

/// Writes containers in the old-style form until the text is long enough.
class Describer {
public:
    void add(const Value& value, std::size_t depth) {
        if (value.isArray()) return addContainer(value, depth, '(', ')');
        if (value.isDictionary()) return addContainer(value, depth, '{', '}');
        if (value.isString())
            m_text += quoted(value.stringOr({}).substr(0, kLongest));
        else
            m_text += value.description();
    }
    std::string take() { return std::move(m_text); }

private:
    void addContainer(const Value& value, std::size_t depth, char open, char close) {
        m_text += open;
        if (depth == kDeepest) {
            m_text += std::string("...") + close;
            return;
        }
        const std::string_view separator = value.isArray() ? "," : ";";
        for (std::size_t i = 0; i < value.size(); ++i) {
            m_text += '\n' + std::string(4 * (depth + 1), ' ');
            if (m_text.size() > kLongest) {
                m_text += "...";
                break;
            }
            if (value.isDictionary()) m_text += quoted(value.keyAt(i).substr(0, kLongest)) + " = ";
            add(value.at(i), depth + 1);
            if (value.isDictionary() || i + 1 < value.size()) m_text += separator;
        }
        m_text += '\n' + std::string(4 * depth, ' ') + close;
    }

    std::string m_text;
};

} // namespace

std::string Value::description() const {
    switch (type()) {
    case Type::nil:
        return "(null)";
    case Type::boolean:
        return boolValue() ? "1" : "0";
    case Type::integer:
        return std::get<Integer>(m_content).negative ? std::to_string(longLongValue())
                                                     : std::to_string(unsignedLongLongValue());
    case Type::real:
        return describeReal(doubleValue());
    case Type::date:
        return describeDate(dateValue());
    case Type::data:
        return describeData(data());
    case Type::string:
        return stringOr({});
    default:
        break;
    }
    Describer describer;
    describer.add(*this, 0);
    return describer.take();
}

} // namespace plist
