#include "lib/plist/JSON.h"

#include "lib/plist/Unicode.h"

#include <array>
#include <cstdio>
#include <string>
#include <string_view>

namespace plist {

std::string QuotedJSON(std::string_view text) {
    std::string quoted = "\"";
    while (!text.empty()) {
        const char32_t character = unicode::takeUTF8(text);
        if (character == '"' || character == '\\') {
            quoted += {'\\', static_cast<char>(character)};
        } else if (character < 0x20 || (character >= 0x7F && character < 0xA0)) {
            std::array<char, 8> escape{};
            std::snprintf(escape.data(), escape.size(), "\\u%04x", static_cast<unsigned>(character));
            quoted += escape.data();
        } else {
            unicode::appendUTF8(quoted, character);
        }
    }
    return quoted + '"';
}

} // namespace plist
