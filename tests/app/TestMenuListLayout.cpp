#include "app/menuListLayout.h"

#include <gtest/gtest.h>
#include <random>

namespace {

std::vector<MenuListRow> rowsOf(std::size_t count, float height = 20) {
    return std::vector<MenuListRow>(count, MenuListRow{height, false});
}

MenuListState stateOf(float height, std::size_t scrollIndex = 0) {
    MenuListState state;
    state.height = height;
    state.scrollIndex = scrollIndex;
    return state;
}

std::size_t visibleCount(const MenuListLayout& layout) {
    return static_cast<std::size_t>(
        std::count_if(layout.places.begin(), layout.places.end(), [](const auto& p) { return !p.hidden; }));
}

TEST(MenuListLayout, ReplacesTheLastRowThatFitsByAnArrow) {
    EXPECT_FALSE(layoutMenuList(rowsOf(5), stateOf(100)).scrollDown) << "an exact fit";
    const auto layout = layoutMenuList(rowsOf(6), stateOf(100));
    EXPECT_EQ(layout.scrollDown, 4U);
    EXPECT_EQ(layout.places[4].y, 0);
    EXPECT_EQ(layout.places[5].y, -20);
    EXPECT_EQ(visibleCount(layout), 5U);
    EXPECT_EQ(layoutMenuList(rowsOf(6), stateOf(115)).places[4].y, 0)
        << "on the edge, with room to spare too";
}

TEST(MenuListLayout, GivesSpareHeightToFlexibleRows) {
    auto rows = rowsOf(4);
    rows[1].flexible = true;
    auto layout = layoutMenuList(rows, stateOf(200));
    EXPECT_EQ(layout.places[1].height, 140) << "spare 120 and the last row's 20";
    EXPECT_EQ(layout.places[3].y, 0);

    rows[2].flexible = true;
    rows.back().height = 16;
    layout = layoutMenuList(rows, stateOf(201));
    EXPECT_EQ(layout.places[1].height, 70) << "(125 + 16) / 2, rounded down";
    EXPECT_EQ(layoutMenuList(rows, stateOf(76)).places[1].height, 0) << "nothing to spare";
}

TEST(MenuListLayout, SurvivesListsTooLowForAnything) {
    for (const float height : {0.0F, 5.0F, 19.0F}) {
        for (const std::size_t index : {0U, 1U, 3U, 4U}) {
            const auto layout = layoutMenuList(rowsOf(4), stateOf(height, index));
            EXPECT_EQ(visibleCount(layout), 0U) << height << " " << index;
        }
    }
    EXPECT_TRUE(layoutMenuList({}, stateOf(100)).places.empty());
}

struct RandomList {
    std::vector<MenuListRow> rows;
    MenuListState state;
};

RandomList randomList(std::mt19937& random) {
    const auto below = [&](std::size_t limit) { return random() % limit; };
    RandomList list;
    constexpr float heights[] = {10, 16, 20, 40};
    for (std::size_t n = below(60); n > 0; --n)
        list.rows.push_back({heights[below(4)], false});
    list.state.height = static_cast<float>(30 + below(600));
    list.state.scrollIndex = below(list.rows.size() + 1);
    list.state.disallowScrolling = below(4) == 0;
    if (list.state.disallowScrolling) list.state.scrollIndex = 0;
    if (below(2)) list.state.topSeparatorHeight = 10.0F;
    return list;
}

TEST(MenuListLayout, LosesNoRowKeepsTheOrderAndNeverOverlaps) {
    std::mt19937 random(7);
    for (int round = 0; round < 3000; ++round) {
        auto [rows, state] = randomList(random);
        if (!rows.empty() && state.disallowScrolling) rows[random() % rows.size()].flexible = true;
        const auto layout = layoutMenuList(rows, state);
        const std::size_t extra = std::size_t{layout.topSeparator.has_value()} + layout.scrollUp.has_value() +
                                  layout.scrollDown.has_value();
        ASSERT_EQ(layout.places.size(), rows.size() + extra);
        float edge = state.height;
        for (const auto& place : layout.places) {
            if (place.hidden) continue;
            EXPECT_LE(place.y + place.height, edge);
            EXPECT_GE(place.y, 0);
            edge = place.y;
        }
    }
}

TEST(MenuListLayout, FindsTheScrollIndexThatSteppingWouldReach) {
    std::mt19937 random(11);
    const auto isHidden = [](const auto& rows, const MenuListState& state, std::size_t target) {
        const auto layout = layoutMenuList(rows, state);
        std::size_t at = target;
        for (const auto& extra : {layout.topSeparator, layout.scrollUp, layout.scrollDown})
            if (extra && *extra <= at) ++at;
        return layout.places[at].hidden;
    };
    for (int round = 0; round < 1500; ++round) {
        auto [rows, state] = randomList(random);
        if (rows.empty()) continue;
        const std::size_t target = random() % rows.size();
        auto stepped = state;
        while (isHidden(rows, stepped, target)) {
            const auto next = scrollIndexUp(stepped);
            if (!next) break;
            stepped.scrollIndex = *next;
        }
        while (isHidden(rows, stepped, target)) {
            const auto next = scrollIndexDown(rows, stepped);
            if (!next) break;
            stepped.scrollIndex = *next;
        }
        ASSERT_EQ(scrollIndexShowing(rows, state, target), stepped.scrollIndex) << round;
    }
}

} // namespace
