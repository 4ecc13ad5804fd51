#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <vector>

/// Where the rows of a list lie, and how far it scrolls. Pure. y grows upwards; rows are stacked from the top
/// edge down.

struct MenuListRow {
    float height = 0; ///< preferred
    bool flexible = false;
};

struct MenuListState {
    float height = 0; ///< of the list; its bottom edge is y = 0
    std::size_t scrollIndex = 0;
    bool disallowScrolling = false;
    std::optional<float> topSeparatorHeight; ///< when the list shows one
    float scrollArrowHeight = 20;
};

struct MenuRowPlace {
    float y = 0; ///< bottom edge
    float height = 0;
    bool hidden = false;
};

struct MenuListLayout {
    /// Where the three extra rows go into the rows, to be inserted in this order.
    std::optional<std::size_t> topSeparator;
    std::optional<std::size_t> scrollUp;
    std::optional<std::size_t> scrollDown;
    std::vector<MenuRowPlace> places; ///< of all rows, the extra ones included
};

/// `state.scrollIndex` must not be above the number of rows.
MenuListLayout layoutMenuList(std::span<const MenuListRow> rows, const MenuListState& state);

/// The scroll index one step on; nothing when the list does not scroll that way.
std::optional<std::size_t> scrollIndexUp(const MenuListState& state);
std::optional<std::size_t> scrollIndexDown(std::span<const MenuListRow> rows, const MenuListState& state);

/// The scroll index after stepping up, then down, for as long as the row at `target` is hidden. As many steps
/// as it takes, in time linear in the rows. No row may be flexible.
std::size_t scrollIndexShowing(std::span<const MenuListRow> rows, MenuListState state, std::size_t target);
