#include "lib/kxAppKit/system/KXFileURL.h"

#include <cctype>
#include <filesystem>
#include <optional>
#include <string>
#include <string_view>

std::optional<std::string> KXFileURLOfPath(std::string_view path) {
    constexpr std::string_view digits = "0123456789ABCDEF";
    constexpr std::string_view kept = "/-._~!$&'()*+,=:@";
    if (path.empty() || path.find('\0') != path.npos) return {};
    std::string url = "file://";
    const auto absolute = std::filesystem::absolute(path);
    for (const char character : absolute.native()) {
        const auto byte = static_cast<unsigned char>(character);
        if ((byte < 0x80 && std::isalnum(byte) != 0) || kept.find(character) != kept.npos)
            url += character;
        else
            url.append({'%', digits[byte >> 4], digits[byte & 15]});
    }
    return url;
}
