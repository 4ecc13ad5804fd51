#include "tools/kxipcJson.h"

#include "lib/plist/JSON.h"
#include "lib/plist/Value.h"

#include <charconv>
#include <cmath>
#include <cstddef>
#include <string>

namespace {

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
        if (isDictionary) result += plist::QuotedJSON(value.keyAt(i)) + ':';
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
        return plist::QuotedJSON(value.stringOr(""));
    case plist::Type::array:
    case plist::Type::dictionary:
        return container(value);
    }
    return "null";
}
