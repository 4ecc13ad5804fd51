#include "lib/plist/Unicode.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace plist::unicode {

namespace {

bool isSurrogate(char32_t character) {
    return character >= 0xD800 && character < 0xE000;
}

char32_t unitAt(std::span<const std::byte> text, std::size_t byte) {
    return std::to_integer<char32_t>(text[byte]) << 8 | std::to_integer<char32_t>(text[byte + 1]);
}

/// How a lead byte starts a sequence: what follows it, its own bits, and the least character so long a form
/// may hold.
struct Lead {
    std::size_t continuations;
    char32_t bits;
    char32_t least;
};

Lead leadOf(unsigned char byte) {
    if (byte >= 0xC2 && byte < 0xE0) return {1, byte & 0x1Fu, 0x80};
    if (byte >= 0xE0 && byte < 0xF0) return {2, byte & 0x0Fu, 0x800};
    if (byte >= 0xF0 && byte < 0xF5) return {3, byte & 0x07u, 0x10000};
    return {0, kReplacement, 0};
}

/// Whether the bytes of one word are all ASCII.
template <class Word>
bool isPlain(const std::byte* bytes) {
    Word word = 0;
    std::memcpy(&word, bytes, sizeof word);
    return (word & static_cast<Word>(0x8080808080808080)) == 0;
}

} // namespace

bool isASCII(std::span<const std::byte> bytes) {
    const std::byte* at = bytes.data();
    const std::byte* end = at + bytes.size();
    if (bytes.size() >= 8) {
        for (; end - at > 8; at += 8)
            if (!isPlain<std::uint64_t>(at)) return false;
        return isPlain<std::uint64_t>(end - 8);
    }
    if (bytes.size() >= 4) return isPlain<std::uint32_t>(at) && isPlain<std::uint32_t>(end - 4);
    return std::ranges::all_of(bytes, [](const std::byte& each) { return isPlain<std::uint8_t>(&each); });
}

char32_t takeUTF8(std::string_view& text) {
    const auto first = static_cast<unsigned char>(text.front());
    text.remove_prefix(1);
    if (first < 0x80) return first;

    const Lead lead = leadOf(first);
    if (text.size() < lead.continuations) return kReplacement;
    char32_t character = lead.bits;
    for (std::size_t i = 0; i < lead.continuations; ++i) {
        const auto next = static_cast<unsigned char>(text[i]);
        if ((next & 0xC0) != 0x80) return kReplacement;
        character = character << 6 | (next & 0x3Fu);
    }
    if (character < lead.least || character > 0x10FFFF || isSurrogate(character)) return kReplacement;
    text.remove_prefix(lead.continuations);
    return character;
}

char32_t takeUTF16(std::span<const std::byte>& text) {
    const char32_t unit = unitAt(text, 0);
    const char32_t next = text.size() >= 4 ? unitAt(text, 2) : 0;
    text = text.subspan(2);
    if (!isSurrogate(unit)) return unit;
    if (unit >= 0xDC00 || next < 0xDC00 || next >= 0xE000) return kReplacement;
    text = text.subspan(2);
    return 0x10000 + ((unit - 0xD800) << 10) + (next - 0xDC00);
}

void appendUTF8(std::string& text, char32_t character) {
    const auto continuation = [&](int shift) {
        return static_cast<char>(0x80 | (character >> shift & 0x3F));
    };
    if (character < 0x80) {
        text += static_cast<char>(character);
    } else if (character < 0x800) {
        text += {static_cast<char>(0xC0 | character >> 6), continuation(0)};
    } else if (character < 0x10000) {
        text += {static_cast<char>(0xE0 | character >> 12), continuation(6), continuation(0)};
    } else {
        text +=
            {static_cast<char>(0xF0 | character >> 18), continuation(12), continuation(6), continuation(0)};
    }
}

void appendUTF16(std::vector<std::byte>& text, char32_t character) {
    if (character > 0xFFFF) {
        appendUTF16(text, 0xD800 + ((character - 0x10000) >> 10));
        character = 0xDC00 + ((character - 0x10000) & 0x3FF);
    }
    text.push_back(static_cast<std::byte>(character >> 8));
    text.push_back(static_cast<std::byte>(character & 0xFF));
}

} // namespace plist::unicode
