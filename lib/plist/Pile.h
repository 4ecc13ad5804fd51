#pragma once

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <memory>
#include <type_traits>
#include <utility>

namespace plist {

/// An array that grows, of plain things. The first `few` of them need no memory of their own: a small message
/// is written in less time than that would take to get.
template <class Item, std::size_t few>
class Pile {
public:
    Pile() = default;
    ~Pile() = default;
    Pile(const Pile&) = delete;
    Pile& operator=(const Pile&) = delete;

    std::size_t size() const { return m_size; }
    Item& operator[](std::size_t index) { return m_items[index]; }
    const Item& operator[](std::size_t index) const { return m_items[index]; }
    const Item* begin() const { return m_items; }
    const Item* end() const { return m_items + m_size; }

    void push(const Item& item) {
        if (m_size == m_capacity) grow(m_size + 1);
        m_items[m_size++] = item;
    }
    /// So many more.
    void extend(std::size_t count, const Item& item) {
        if (m_capacity - m_size < count) grow(m_size + count);
        std::fill_n(m_items + m_size, count, item);
        m_size += count;
    }

private:
    static_assert(std::is_trivially_copyable_v<Item> && std::is_trivially_destructible_v<Item>);

    void grow(std::size_t least) {
        const auto capacity = std::max(2 * m_capacity, least);
        auto memory = std::make_unique_for_overwrite<std::byte[]>(capacity * sizeof(Item));
        std::memcpy(memory.get(), m_items, m_size * sizeof(Item));
        m_memory = std::move(memory);
        m_items = reinterpret_cast<Item*>(m_memory.get());
        m_capacity = capacity;
    }

    alignas(Item) std::byte m_room[few * sizeof(Item)];
    std::unique_ptr<std::byte[]> m_memory;
    Item* m_items = reinterpret_cast<Item*>(m_room);
    std::size_t m_size = 0;
    std::size_t m_capacity = few;
};

} // namespace plist
