#pragma once

#include "lib/plist/Binary.h"

#include <algorithm>
#include <gtest/gtest.h>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace plist {

inline Data dataOf(std::string_view bytes) {
    return Data::copyOf(bytes.data(), bytes.size());
}

inline PeekBytes peekInto(const Data& file) {
    return [file](std::size_t offset, std::span<std::byte> to) {
        std::ranges::copy(file.span().subspan(offset, to.size()), to.begin());
        return true;
    };
}

/// Why the bytes are refused, however they are looked at; empty when they are not.
inline std::string errorOf(const Data& file, const Limits& limits = {}) {
    std::string error, peeked;
    const Value value = Parse(file, error, limits);
    EXPECT_EQ(value.isNil(), !error.empty());
    EXPECT_EQ(Parse(file, peeked, limits, peekInto(file)).isNil(), !error.empty());
    EXPECT_EQ(peeked, error);
    return error;
}
inline std::string errorOf(std::string_view text, const Limits& limits = {}) {
    return errorOf(dataOf(text), limits);
}

/// Fails the test when the file is refused.
inline Value parsed(const Data& file) {
    std::string error;
    const Value value = Parse(file, error);
    EXPECT_EQ(error, "");
    return value;
}
/// Fails the test when the value cannot be written.
inline Encoded written(const Value& value) {
    std::string error;
    const Encoded encoded = WriteBinary(value, error);
    EXPECT_EQ(error, "");
    return encoded;
}
/// The same value as a view into its written form.
inline Value reread(const Value& value) {
    return parsed(written(value).joined());
}

inline std::string bigEndian(std::uint64_t number, std::size_t size) {
    std::string bytes(size, '\0');
    for (; size > 0; --size, number >>= 8)
        bytes[size - 1] = static_cast<char>(number & 0xFF);
    return bytes;
}

/// A binary property list put together byte by byte, whatever the format says about it. References take 4
/// bytes.
struct RawFile {
    std::vector<std::string> objects;

    static std::string container(char kind, const std::vector<std::uint64_t>& references, std::size_t count) {
        std::string bytes = std::string(1, static_cast<char>(kind | 0xF)) + '\x12' + bigEndian(count, 4);
        for (const std::uint64_t reference : references)
            bytes += bigEndian(reference, 4);
        return bytes;
    }
    static std::string array(const std::vector<std::uint64_t>& references) {
        return container('\xA0', references, references.size());
    }
    static std::string dictionary(const std::vector<std::uint64_t>& references) {
        return container('\xD0', references, references.size() / 2);
    }

    Data build() const {
        std::string bytes = "bplist00", table;
        for (const std::string& object : objects) {
            table += bigEndian(bytes.size(), 8);
            bytes += object;
        }
        return finish(bytes, table);
    }
    static Data finish(const std::string& objectBytes, const std::string& table) {
        return dataOf(objectBytes + table + bigEndian(8, 7) + bigEndian(4, 1) +
                      bigEndian(table.size() / 8, 8) + bigEndian(0, 8) + bigEndian(objectBytes.size(), 8));
    }
};

} // namespace plist
