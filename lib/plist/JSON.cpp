#include "lib/plist/JSON.h"

#include <array>
#include <cstdio>
#include <string>
#include <string_view>

namespace plist {

std::string QuotedJSON(std::string_view text) {
    std::string quoted = "\"";
    for (const char character : text) {
        if (character == '"' || character == '\\') {
            quoted += {'\\', character};
        } else if (const auto code = static_cast<unsigned char>(character); code < 0x20) {
            std::array<char, 8> escape{};
            std::snprintf(escape.data(), escape.size(), "\\u%04x", unsigned{code});
            quoted += escape.data();
        } else {
            quoted += character;
        }
    }
    return quoted + '"';
}

} // namespace plist
