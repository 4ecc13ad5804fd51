#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <iterator>
#include <memory>
#include <span>
#include <utility>

namespace plist {

/// Hashes that differ from process to process, so that nobody can prepare strings that collide.
class Hash {
public:
    std::uint64_t of(std::span<const std::byte> bytes) const {
        const std::size_t size = bytes.size();
        const std::byte* at = bytes.data();
        std::uint64_t hash = mix(m_seed, size);
        if (size < 8) return mix(hash, loadFew(at, size));
        // Some bytes may count twice: beside the size that does no harm.
        for (const auto* last = at + size - 8; at < last; at += 8)
            hash = mix(hash, load<std::uint64_t>(at));
        return mix(hash, load<std::uint64_t>(bytes.data() + size - 8));
    }
    /// Looks at 8 places of 8 bytes or more: reading megabytes of icons to find two alike would cost more
    /// than all else, and each place costs a cache line.
    std::uint64_t ofSamples(std::span<const std::byte> bytes) const {
        constexpr std::size_t kSamples = 8;
        if (bytes.size() <= 8 * kSamples) return of(bytes);
        std::uint64_t hash = mix(m_seed, bytes.size());
        // Not the ends: the corners of most icons are empty.
        const std::size_t step = (bytes.size() - 8) / kSamples;
        for (std::size_t i = 0; i < kSamples; ++i)
            hash = mix(hash, load<std::uint64_t>(bytes.data() + step / 2 + i * step));
        return hash;
    }
    std::uint64_t of(const void* place, std::size_t size) const {
        return mix(mix(m_seed, reinterpret_cast<std::uintptr_t>(place)), size);
    }

private:
    static std::uint64_t seed();
    static std::uint64_t mix(std::uint64_t hash, std::uint64_t word) {
        hash = (hash ^ word) * 0x9E3779B97F4A7C15;
        return hash ^ hash >> 32;
    }
    template <class Word>
    static std::uint64_t load(const std::byte* bytes) {
        Word word = 0;
        std::memcpy(&word, bytes, sizeof word);
        return word;
    }
    /// Fewer than 8.
    static std::uint64_t loadFew(const std::byte* bytes, std::size_t size) {
        if (size >= 4) return load<std::uint32_t>(bytes) << 32 | load<std::uint32_t>(bytes + size - 4);
        if (size >= 2) return load<std::uint16_t>(bytes) << 16 | load<std::uint16_t>(bytes + size - 2);
        return size == 1 ? load<std::uint8_t>(bytes) : 0;
    }

    const std::uint64_t m_seed = seed();
};

/// Finds numbered things that were seen before, by hash.
class Uniquer {
public:
    using Index = std::uint32_t;
    static constexpr Index kNone = UINT32_MAX;
    static constexpr unsigned kForEver = UINT32_MAX;

    Uniquer() = default;
    ~Uniquer() = default;
    Uniquer(const Uniquer&) = delete;
    Uniquer& operator=(const Uniquer&) = delete;

    /// The index of the known thing for which `isSame(index)` holds; or `kNone`, and `index` is known from
    /// now on. Gives up after `patience` comparisons: then it is `kNone` and stays unknown.
    template <class IsSame>
    Index findOrAdd(std::uint64_t hash, Index index, unsigned patience, const IsSame& isSame) {
        if (2 * m_used >= m_size) grow();
        const auto tag = static_cast<std::uint32_t>(hash);
        Slot* slot = slotFor(tag);
        for (; slot->index != kNone; slot = after(slot)) {
            if (slot->tag != tag) continue;
            if (isSame(slot->index)) return slot->index;
            if (--patience == 0) return kNone;
        }
        *slot = {tag, index};
        ++m_used;
        return kNone;
    }

private:
    struct Slot {
        std::uint32_t tag;
        Index index;
    };

    Slot* slotFor(std::uint32_t tag) const { return m_slots + (tag & (m_size - 1)); }
    Slot* after(const Slot* slot) const {
        return m_slots + (static_cast<std::size_t>(slot + 1 - m_slots) & (m_size - 1));
    }

    void grow() {
        const std::span old(m_slots, m_size);
        const auto memory = std::exchange(m_memory, nullptr);
        m_size = std::max(std::size(m_few), 2 * m_size);
        if (m_size > std::size(m_few)) m_memory = std::make_unique_for_overwrite<Slot[]>(m_size);
        m_slots = m_memory ? m_memory.get() : m_few;
        std::fill_n(m_slots, m_size, Slot{0, kNone});
        for (const Slot& each : old) {
            if (each.index == kNone) continue;
            Slot* slot = slotFor(each.tag);
            while (slot->index != kNone)
                slot = after(slot);
            *slot = each;
        }
    }

    Slot m_few[32]; ///< enough for a small message, which is written in less time than memory takes to get
    std::unique_ptr<Slot[]> m_memory;
    Slot* m_slots = nullptr;
    std::size_t m_size = 0; ///< a power of two, at least twice those in use
    std::size_t m_used = 0;
};

} // namespace plist
