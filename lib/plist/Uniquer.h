#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory_resource>
#include <span>
#include <vector>

namespace plist {

/// The hashes differ from process to process, so that nobody can prepare strings that collide.
std::uint64_t hashOf(std::span<const std::byte> bytes);
/// Looks at 8 places of 8 bytes or more: reading megabytes of icons to find two alike would cost more than
/// all else, and each place costs a cache line.
std::uint64_t sampledHashOf(std::span<const std::byte> bytes);
std::uint64_t hashOf(const void* place, std::size_t size);

/// Finds numbered things that were seen before, by hash.
class Uniquer {
public:
    using Index = std::uint32_t;
    static constexpr Index kNone = UINT32_MAX;
    static constexpr unsigned kForEver = UINT32_MAX;

    explicit Uniquer(std::pmr::memory_resource& memory)
        : m_slots(&memory) {}

    /// The index of the known thing for which `isSame(index)` holds; or `kNone`, and `index` is known from
    /// now on. Gives up after `patience` comparisons: then it is `kNone` and stays unknown.
    template <class IsSame>
    Index findOrAdd(std::uint64_t hash, Index index, unsigned patience, const IsSame& isSame) {
        if (2 * (m_used + 1) > m_slots.size()) grow();
        const auto tag = static_cast<std::uint32_t>(hash);
        std::size_t at = tag & (m_slots.size() - 1);
        for (; m_slots[at].index != kNone; at = (at + 1) & (m_slots.size() - 1)) {
            if (m_slots[at].tag != tag) continue;
            if (isSame(m_slots[at].index)) return m_slots[at].index;
            if (--patience == 0) return kNone;
        }
        m_slots[at] = {tag, index};
        ++m_used;
        return kNone;
    }

private:
    struct Slot {
        std::uint32_t tag = 0;
        Index index = kNone;
    };

    void grow() {
        std::pmr::vector<Slot> old(std::max<std::size_t>(32, 2 * m_slots.size()), m_slots.get_allocator());
        old.swap(m_slots);
        for (const Slot& slot : old) {
            if (slot.index == kNone) continue;
            std::size_t at = slot.tag & (m_slots.size() - 1);
            while (m_slots[at].index != kNone)
                at = (at + 1) & (m_slots.size() - 1);
            m_slots[at] = slot;
        }
    }

    std::pmr::vector<Slot> m_slots; ///< a power of two of them, at most half in use
    std::size_t m_used = 0;
};

} // namespace plist
