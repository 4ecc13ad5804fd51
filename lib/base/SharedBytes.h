#pragma once

#include <cstddef>
#include <cstring>
#include <functional>
#include <memory>
#include <span>
#include <utility>

/// A run of immutable bytes and what keeps it alive: a buffer, a mapping, or nothing for static storage.
/// Copying shares; any thread may read. Two compare equal when their bytes do.
class SharedBytes {
public:
    SharedBytes() = default;
    SharedBytes(std::span<const std::byte> bytes, std::shared_ptr<const void> owner)
        : m_bytes(bytes)
        , m_owner(std::move(owner)) {}

    /// A private copy of `size` bytes at `data`.
    static SharedBytes copyOf(const void* data, std::size_t size) {
        auto buffer = std::make_shared_for_overwrite<std::byte[]>(size);
        if (size > 0) std::memcpy(buffer.get(), data, size);
        return {{buffer.get(), size}, buffer};
    }

    const std::byte* data() const { return m_bytes.data(); }
    std::size_t size() const { return m_bytes.size(); }
    bool empty() const { return m_bytes.empty(); }
    std::span<const std::byte> span() const { return m_bytes; }
    // NOLINTNEXTLINE(google-explicit-constructor): it is one
    operator std::span<const std::byte>() const { return m_bytes; }

    /// A part of these bytes under the same owner. `offset + size` must not pass the end.
    SharedBytes slice(std::size_t offset, std::size_t size) const {
        return {m_bytes.subspan(offset, size), m_owner};
    }

    friend bool operator==(const SharedBytes& a, const SharedBytes& b) {
        return a.size() == b.size() && (a.empty() || std::memcmp(a.data(), b.data(), a.size()) == 0);
    }

private:
    std::span<const std::byte> m_bytes;
    std::shared_ptr<const void> m_owner;
};

/// Copies a few bytes of many out, where to touch them costs more: in memory that was mapped and not read
/// yet. False when it failed, or the bytes end before.
using PeekBytes = std::function<bool(std::size_t offset, std::span<std::byte> to)>;
