#pragma once

#include "lib/plist/Binary.h"
#include "lib/plist/Document.h"

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <memory>
#include <span>
#include <vector>

namespace plist {

/// Bytes that a number up to `most` takes: 1, 2, 4 or 8.
inline std::size_t widthFor(std::uint64_t most) {
    if (most <= UINT8_MAX) return 1;
    if (most <= UINT16_MAX) return 2;
    return most <= UINT32_MAX ? 4 : 8;
}

/// A number of `size` bytes, big-endian, stored at `to`. Answers where it ends.
inline std::byte* storeNumber(std::byte* to, std::uint64_t number, std::size_t size) {
    for (std::size_t i = size; i > 0; --i, number >>= 8)
        to[i - 1] = static_cast<std::byte>(number & 0xFF);
    return to + size;
}

/// Bytes, stored at `to`. Answers where they end.
inline std::byte* store(std::byte* to, std::span<const std::byte> bytes) {
    if (!bytes.empty()) std::memcpy(to, bytes.data(), bytes.size());
    return to + bytes.size();
}

/// A small object being encoded: a number, or the head of something longer.
class Token {
public:
    Token& put(std::uint64_t number, std::size_t size) {
        storeNumber(m_bytes + m_size, number, size);
        m_size += size;
        return *this;
    }
    /// In the fewest bytes. Those of 8 bytes have a sign, so larger ones take 16.
    Token& putInteger(std::uint64_t number) {
        const bool is16 = number > INT64_MAX;
        const std::size_t width = is16 ? 16 : widthFor(number);
        put(static_cast<unsigned>(Kind::integer) << 4 | static_cast<unsigned>(std::countr_zero(width)), 1);
        return is16 ? put(0, 8).put(number, 8) : put(number, width);
    }
    Token& putHead(Kind kind, std::uint64_t count) {
        put(static_cast<unsigned>(kind) << 4 | std::min<std::uint64_t>(count, 0xF), 1);
        return count < 0xF ? *this : putInteger(count);
    }
    std::span<const std::byte> bytes() const { return {m_bytes, m_size}; }

private:
    std::byte m_bytes[18];
    std::size_t m_size = 0;
};

/// The bytes of a file, with stretches of it that stand elsewhere.
class Output {
public:
    explicit Output(std::size_t capacity)
        : m_own(std::make_unique_for_overwrite<std::byte[]>(capacity))
        , m_capacity(capacity) {}

    std::size_t size() const { return m_used + m_elsewhere; }
    /// How much was put here, not elsewhere; and what stands there.
    std::size_t mark() const { return m_used; }
    const std::byte* at(std::size_t mark) const { return m_own.get() + mark; }

    /// Room for so many bytes, to be filled before anything else is put.
    std::byte* extend(std::size_t size) {
        if (m_capacity - m_used < size) grow(size);
        m_used += size;
        return m_own.get() + m_used - size;
    }
    void put(std::span<const std::byte> bytes) { store(extend(bytes.size()), bytes); }
    void putElsewhere(std::span<const std::byte> bytes) {
        m_breaks.push_back({m_used, bytes});
        m_elsewhere += bytes.size();
    }

    /// All of it; what stands elsewhere is held by `holder`.
    Encoded finish(const Value& holder) &&;

private:
    struct Break {
        std::size_t at;
        std::span<const std::byte> bytes;
    };

    void grow(std::size_t size);

    std::unique_ptr<std::byte[]> m_own;
    std::size_t m_capacity;
    std::size_t m_used = 0;
    std::vector<Break> m_breaks;
    std::size_t m_elsewhere = 0;
};

} // namespace plist
