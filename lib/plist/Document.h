#pragma once

#include "lib/plist/Value.h"

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <memory>
#include <span>
#include <string>
#include <string_view>

namespace plist {

/// Kinds of object of the binary format: the high half of the first byte.
enum class Kind : std::uint8_t {
    boolean = 0x0,
    integer = 0x1,
    real = 0x2,
    date = 0x3,
    data = 0x4,
    ascii = 0x5,
    utf16 = 0x6,
    array = 0xA,
    dictionary = 0xD,
};

/// Data of this size or more is written last, and not touched while a document is read.
inline constexpr std::size_t kLargeData = std::size_t{32} << 10;

/// 8 bytes, big-endian.
inline std::uint64_t readWord(const std::byte* bytes) {
    std::uint64_t word = 0;
    std::memcpy(&word, bytes, sizeof word);
    if constexpr (std::endian::native == std::endian::little) word = __builtin_bswap64(word);
    return word;
}

/// Big-endian, of 1 to 8 bytes. Loads 8 whatever the size: wherever a number of a document stands, at least
/// the trailer follows.
inline std::uint64_t readNumber(const std::byte* bytes, std::size_t size) {
    return readWord(bytes) >> (64 - 8 * size);
}

/// An object's first bytes, taken apart.
struct Header {
    static constexpr std::size_t kMalformed = SIZE_MAX;

    Kind kind;
    /// Bytes, UTF-16 units, elements or entries; `kMalformed` for what is no object.
    std::size_t count;
    const std::byte* payload;
    bool flag; ///< of a boolean

    bool isText() const { return kind == Kind::ascii || kind == Kind::utf16; }
    std::span<const std::byte> bytes() const { return {payload, count}; }
    std::span<const std::byte> units() const { return {payload, 2 * count}; }
    std::string_view ascii() const { return {reinterpret_cast<const char*>(payload), count}; }
};

inline Kind kindAt(const std::byte* object) {
    return static_cast<Kind>(*object >> 4);
}

/// Of an object whose first byte says how long it is.
Header headerOfFixedSize(const std::byte* object);

/// Looks at no more than 10 bytes, so it is safe on any byte in front of a document's trailer.
inline Header headerAt(const std::byte* object) {
    const Kind kind = kindAt(object);
    const auto low = std::to_integer<std::size_t>(*object & std::byte{0xF});
    constexpr auto bit = [](Kind each) { return 1u << static_cast<unsigned>(each); };
    constexpr auto counted =
        bit(Kind::data) | bit(Kind::ascii) | bit(Kind::utf16) | bit(Kind::array) | bit(Kind::dictionary);
    if ((counted & bit(kind)) == 0) return headerOfFixedSize(object);
    if (low < 0xF) return {kind, low, object + 1, false};

    const auto extension = std::to_integer<unsigned>(object[1]);
    const std::size_t width = std::size_t{1} << (extension & 0x3);
    const bool isNumber = extension >> 2 == static_cast<unsigned>(Kind::integer) << 2;
    return {kind, isNumber ? readNumber(object + 2, width) : Header::kMalformed, object + 2 + width, false};
}

/// What a string adds to the number of objects.
inline std::size_t weightOfText(std::size_t bytes) {
    return bytes / 64;
}

/// Parsed bytes and how to find objects in them. All that its members are asked for has been validated.
class Document {
public:
    static constexpr std::size_t kPrologue = 8; ///< "bplist00"
    static constexpr std::size_t kTrailer = 32;

    /// A table of numbers of one size.
    class Numbers {
    public:
        Numbers() = default;
        /// Of 1 to 8 bytes each.
        explicit Numbers(std::size_t size)
            : m_size(size)
            , m_shift(static_cast<unsigned>(64 - 8 * size)) {}
        std::size_t size() const { return m_size; }
        std::uint64_t at(const std::byte* start, std::size_t index) const {
            return readWord(start + index * m_size) >> m_shift;
        }

    private:
        std::size_t m_size = 0;
        unsigned m_shift = 0;
    };

    Data bytes;
    Numbers offsets;
    Numbers references;
    std::size_t objectCount = 0;
    std::size_t table = 0; ///< where the offsets start

    std::uint64_t offsetOf(std::uint64_t index) const { return offsets.at(bytes.data() + table, index); }
    const std::byte* child(const Header& container, std::size_t i) const {
        return bytes.data() + offsetOf(references.at(container.payload, i));
    }
};

/// What the rest of this library may know of a value.
struct Access {
    using View = Value::View;
    using Integer = Value::Integer;

    static const Value::Content& content(const Value& value) { return value.m_content; }
    /// Numbers and dates are read now, all else when asked for.
    static Value make(const std::shared_ptr<const Document>& document, const std::byte* object);
    /// A string's text, in place or else in `scratch`. Empty for other types.
    static std::string_view text(const Value& value, std::string& scratch);
    static std::string_view text(const Header& header, std::string& scratch);
    /// A dictionary's key, likewise. `index` must be below its size.
    static std::string_view keyAt(const Value& dictionary, std::size_t index, std::string& scratch);
    /// Tells a container from all others of the same time; null for other types.
    static const void* identity(const Value& container);
    /// Whether nothing else refers to this container.
    static bool isAlone(const Value& container);
    /// What data holds, empty for other types.
    static std::span<const std::byte> bytes(const Value& value);
    static bool isNegative(const Value& integer) { return std::get<Integer>(integer.m_content).negative; }
    /// Asks for what `all` comes to soon: a menu's many small parts lie scattered in cold memory.
    static void fetchAhead(const Array& array, std::size_t index);
    /// Whether `holds(element)` for all elements or entries' values, asked in order until it is false.
    template <class Predicate>
    static bool all(const Value& container, const Predicate& holds);
};

template <class Predicate>
bool Access::all(const Value& container, const Predicate& holds) {
    if (const auto* array = std::get_if<std::shared_ptr<const Array>>(&container.m_content)) {
        for (std::size_t i = 0; i < (*array)->size(); ++i) {
            fetchAhead(**array, i);
            if (!holds((**array)[i])) return false;
        }
        return true;
    }
    if (const auto* entries = std::get_if<std::shared_ptr<const Dictionary>>(&container.m_content))
        return std::ranges::all_of((*entries)->entries(), holds, &Dictionary::Entry::second);
    return std::ranges::all_of(container.begin(), container.end(), holds);
}

} // namespace plist
