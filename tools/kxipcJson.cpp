#include "tools/kxipcJson.h"

#include <charconv>
#include <cmath>
#include <cstdio>

namespace {

std::string quoted(const std::string& text) {
    std::string result = "\"";
    for (const char character : text) {
        if (character == '"' || character == '\\') {
            result += {'\\', character};
        } else if (static_cast<unsigned char>(character) < 0x20) {
            char escape[8];
            std::snprintf(escape, sizeof escape, "\\u%04x", static_cast<unsigned>(character));
            result += escape;
        } else {
            result += character;
        }
    }
    return result + '"';
}

std::string number(double value) {
    if (!std::isfinite(value)) return "null";
    char text[32];
    return {text, std::to_chars(text, text + sizeof text, value).ptr};
}

std::string integer(const plist::Value& value) {
    const bool isNegative = value.doubleValue() < 0;
    return isNegative ? std::to_string(value.longLongValue()) : std::to_string(value.unsignedLongLongValue());
}

std::string container(const plist::Value& value) {
    const bool isDictionary = value.isDictionary();
    std::string result(1, isDictionary ? '{' : '[');
    for (std::size_t i = 0; i < value.size(); ++i) {
        if (i > 0) result += ',';
        if (isDictionary) result += quoted(value.keyAt(i)) + ':';
        result += KxipcJson(value.at(i));
    }
    return result + (isDictionary ? '}' : ']');
}

} // namespace

std::string KxipcJson(const plist::Value& value) {
    switch (value.type()) {
    case plist::Type::nil:
        return "null";
    case plist::Type::boolean:
        return value.boolValue() ? "true" : "false";
    case plist::Type::integer:
        return integer(value);
    case plist::Type::real:
        return number(value.doubleValue());
    case plist::Type::date:
        return number(value.dateValue().secondsSince2001);
    case plist::Type::data:
        return "\"<" + std::to_string(value.data().size()) + " bytes>\"";
    case plist::Type::string:
        return quoted(value.stringOr(""));
    case plist::Type::array:
    case plist::Type::dictionary:
        return container(value);
    }
    return "null";
}
