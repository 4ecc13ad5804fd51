#include "server/Record.h"

#include "lib/base/Log.h"
#include "lib/ipc/KXIPCMessage.h"
#include "lib/plist/JSON.h"
#include "lib/plist/Value.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>
#include <string_view>

namespace tessel {
namespace {

// What a message holds is the sender's choice: a line is bounded whatever it is.
constexpr std::size_t maxText = 200; // of one string, in bytes
constexpr std::size_t maxElements = 32;
constexpr int maxDepth = 2;

std::string Quoted(std::string_view text) {
    std::size_t end = std::min(text.size(), maxText);
    while (end > 0 && end < text.size() && (static_cast<unsigned char>(text[end]) & 0xC0) == 0x80)
        --end; // the middle of a character
    return plist::QuotedJSON(text.substr(0, end));
}

std::string Json(const plist::Value& value, int depth);

/// Arrays of strings element by element, all others as their length.
std::string Elements(const plist::Value& container, int depth) {
    const bool isDictionary = container.isDictionary();
    const std::size_t count = container.size();
    if (count > maxElements || depth > maxDepth || (!isDictionary && !container.at(0).isString()))
        return std::to_string(count);
    std::string text;
    for (std::size_t i = 0; i < count; ++i) {
        if (i > 0) text += ", ";
        if (isDictionary) text += Quoted(container.keyAt(i)) + ": ";
        text += Json(container.at(i), depth + 1);
    }
    return isDictionary ? "{" + text + "}" : "[" + text + "]";
}

std::string Json(const plist::Value& value, int depth) {
    switch (value.type()) {
    case plist::Type::string:
        return Quoted(value.stringOr(""));
    case plist::Type::data:
        return std::to_string(value.data().size());
    case plist::Type::array:
    case plist::Type::dictionary:
        return Elements(value, depth);
    case plist::Type::boolean:
        return value.boolValue() ? "true" : "false";
    case plist::Type::nil:
        return "{}";
    default:
        return value.description();
    }
}

} // namespace

std::string DigestLine(const char* direction, const KXIPCMessage& message) {
    return message.name().value_or("") + " " + direction + " " + Json(message.userInfo(), 0);
}

bool Record::open(const std::string& path) {
    m_file.reset(std::fopen(path.c_str(), "a"));
    if (!m_file) Log("The record \"%s\" cannot be written: %s\n", path.c_str(), std::strerror(errno));
    return m_file != nullptr;
}

void Record::add(const std::string& line) {
    if (!m_file) return;
    std::fprintf(m_file.get(), "%s\n", line.c_str());
    std::fflush(m_file.get());
}

} // namespace tessel
