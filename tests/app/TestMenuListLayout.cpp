#include "app/menuListLayout.h"

#include <algorithm>
#include <cmath>
#include <gtest/gtest.h>
#include <numeric>
#include <random>

namespace {

struct List {
    std::vector<MenuListRow> rows;
    MenuListState state;

    List(std::size_t count, float height)
        : rows(count, MenuListRow{20, false}) {
        state.height = height;
    }
    MenuListLayout layout() const { return layoutMenuList(rows, state); }
};

TEST(MenuListLayout, ReplacesTheLastRowThatFitsByAnArrow) {
    EXPECT_FALSE(List(5, 100).layout().scrollDown) << "an exact fit";
    for (const float height : {100.0F, 115.0F}) {
        const auto layout = List(6, height).layout();
        EXPECT_EQ(layout.scrollDown, 4U);
        EXPECT_EQ(layout.places[4].y, 0) << "on the edge, with room to spare too";
        EXPECT_EQ(layout.places[5].y, -20);
    }
}

TEST(MenuListLayout, GivesSpareHeightToFlexibleRows) {
    List list(4, 201);
    list.rows[1].flexible = list.rows[2].flexible = true;
    list.rows[3].height = 16;
    EXPECT_EQ(list.layout().places[1].height, 70) << "(125 + 16) / 2, rounded down";
    list.state.height = 76;
    EXPECT_EQ(list.layout().places[1].height, 0) << "nothing to spare";
}

List randomList(std::mt19937& random, std::size_t lowest) {
    const auto below = [&](std::size_t limit) { return random() % limit; };
    List list(below(60), static_cast<float>(lowest + below(600)));
    constexpr float heights[] = {10, 16, 20, 40};
    list.state.disallowScrolling = below(4) == 0;
    for (auto& row : list.rows)
        row = {heights[below(4)], list.state.disallowScrolling && below(20) == 0};
    if (!list.state.disallowScrolling) list.state.scrollIndex = below(list.rows.size() + 1);
    if (below(2)) list.state.topSeparatorHeight = 10.0F;
    return list;
}

TEST(MenuListLayout, LosesNoRowKeepsTheOrderAndNeverOverlaps) {
    std::mt19937 random(7);
    for (int round = 0; round < 3000; ++round) {
        const List list = randomList(random, 30);
        const auto layout = list.layout();
        std::vector<float> heights; // what is not flexible, from the top down
        for (const auto& row : list.rows)
            heights.push_back(row.flexible ? -1 : row.height);
        const auto insert = [&](std::optional<std::size_t> at, float height) {
            if (at) heights.insert(heights.begin() + static_cast<std::ptrdiff_t>(*at), height);
        };
        insert(layout.topSeparator, 10);
        insert(layout.scrollUp, 20);
        insert(layout.scrollDown, 20);
        ASSERT_EQ(layout.places.size(), heights.size());
        float edge = INFINITY;
        for (std::size_t i = 0; i < heights.size(); ++i) {
            const auto& place = layout.places[i];
            EXPECT_TRUE(heights[i] < 0 || place.height == heights[i]);
            EXPECT_EQ(place.hidden, place.y < 0 || place.y + place.height > list.state.height);
            if (place.hidden) continue;
            EXPECT_LE(place.y + place.height, edge);
            edge = place.y;
        }
    }
}

bool isHidden(const List& list, std::size_t row) {
    const auto layout = list.layout();
    for (const auto& extra : {layout.topSeparator, layout.scrollUp, layout.scrollDown})
        if (extra && *extra <= row) ++row;
    return layout.places[row].hidden;
}

TEST(MenuListLayout, FindsTheScrollIndexThatSteppingWouldReach) {
    std::mt19937 random(11);
    for (int round = 0; round < 1500; ++round) {
        const List list = randomList(random, 0);
        if (list.rows.empty() || list.state.disallowScrolling) continue;
        const std::size_t target = random() % list.rows.size();
        List stepped = list;
        for (const bool up : {true, false})
            while (isHidden(stepped, target)) {
                const auto next =
                    up ? scrollIndexUp(stepped.state) : scrollIndexDown(stepped.rows, stepped.state);
                if (!next) break;
                stepped.state.scrollIndex = *next;
            }
        ASSERT_EQ(scrollIndexShowing(list.rows, list.state, target), stepped.state.scrollIndex) << round;
    }
}

} // namespace
