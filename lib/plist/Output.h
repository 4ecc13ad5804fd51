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

/// A number of 1 to 8 bytes, big-endian, stored at `to`. Answers where it ends; 8 bytes are written whatever
/// the size.
inline std::byte* storeNumber(std::byte* to, std::uint64_t number, std::size_t size) {
    number <<= 64 - 8 * size;
    if constexpr (std::endian::native == std::endian::little) number = __builtin_bswap64(number);
    std::memcpy(to, &number, sizeof number);
    return to + size;
}

/// The bytes of a file, with stretches of it that stand elsewhere.
class Output {
public:
    explicit Output(std::size_t capacity)
        : m_own(std::make_shared_for_overwrite<std::byte[]>(capacity))
        , m_capacity(capacity) {}

    std::size_t size() const { return m_used + m_elsewhere; }
    /// How much was put here, not elsewhere; and what stands there.
    std::size_t mark() const { return m_used; }
    const std::byte* at(std::size_t mark) const { return m_own.get() + mark; }

    /// Room for so many bytes, to be filled before anything else is put. 8 more may be written there.
    std::byte* extend(std::size_t size) {
        if (m_capacity - m_used < size + kSlack) grow(size + kSlack);
        m_used += size;
        return m_own.get() + m_used - size;
    }
    /// Takes back what was put here last.
    void truncate(std::size_t mark) { m_used = mark; }

    Output& put(std::span<const std::byte> bytes) {
        std::byte* to = extend(bytes.size());
        if (!bytes.empty()) std::memcpy(to, bytes.data(), bytes.size());
        return *this;
    }
    Output& putNumber(std::uint64_t number, std::size_t size) {
        storeNumber(extend(size), number, size);
        return *this;
    }
    /// In the fewest bytes. Those of 8 bytes have a sign, so larger ones take 16.
    Output& putInteger(std::uint64_t number) {
        const bool is16 = number > INT64_MAX;
        const std::size_t width = is16 ? 16 : widthFor(number);
        putNumber(static_cast<unsigned>(Kind::integer) << 4 | static_cast<unsigned>(std::countr_zero(width)),
                  1);
        return is16 ? putNumber(0, 8).putNumber(number, 8) : putNumber(number, width);
    }
    Output& putHead(Kind kind, std::uint64_t count) {
        putNumber(static_cast<unsigned>(kind) << 4 | std::min<std::uint64_t>(count, 0xF), 1);
        return count < 0xF ? *this : putInteger(count);
    }
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

    static constexpr std::size_t kSlack = 8;

    void grow(std::size_t size);

    std::shared_ptr<std::byte[]> m_own;
    std::size_t m_capacity;
    std::size_t m_used = 0;
    std::vector<Break> m_breaks;
    std::size_t m_elsewhere = 0;
};

} // namespace plist
