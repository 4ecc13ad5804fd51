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

/// Big-endian, of 1 to 8 bytes. Loads 8 whatever the size: wherever a number of a document stands, at least
/// the trailer follows.
inline std::uint64_t readNumber(const std::byte* bytes, std::size_t size) {
    std::uint64_t number = 0;
    std::memcpy(&number, bytes, sizeof number);
    if constexpr (std::endian::native == std::endian::little) number = __builtin_bswap64(number);
    return number >> (64 - 8 * size);
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

/// Looks at no more than 10 bytes, so it is safe on any byte in front of a document's trailer.
Header headerAt(const std::byte* object);

/// What a string adds to the number of objects.
inline std::size_t weightOfText(std::size_t bytes) {
    return bytes / 64;
}

/// Parsed bytes and how to find objects in them. All that its members are asked for has been validated.
class Document {
public:
    static constexpr std::size_t kPrologue = 8; ///< "bplist00"
    static constexpr std::size_t kTrailer = 32;

    Data bytes;
    std::size_t offsetSize = 0;
    std::size_t referenceSize = 0;
    std::size_t objectCount = 0;
    std::size_t table = 0; ///< where the offsets start

    std::uint64_t offsetOf(std::uint64_t index) const {
        return readNumber(bytes.data() + table + index * offsetSize, offsetSize);
    }
    std::uint64_t reference(const std::byte* references, std::size_t i) const {
        return readNumber(references + i * referenceSize, referenceSize);
    }
    const std::byte* child(const std::byte* references, std::size_t i) const {
        return bytes.data() + offsetOf(reference(references, i));
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
