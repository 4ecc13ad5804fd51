#include "platform/linux/PanelPlacement.h"

#include <gtest/gtest.h>

namespace {

/// The panel as it is asked for: right below the item, one point past its right edge.
KXRect hanging(const KXRect& item, float width = 480, float height = 500) {
    return {item.maxX() - width + 1, item.y - height, width, height};
}

TEST(PanelPlacement, MovesThePanelOnlyFromWhereThereIsNoRoom) {
    const struct {
        const char* what;
        KXRect item, available;
        bool rightToLeft;
        KXPoint placed;
    } cases[] = {
        {"top right, exactly as asked", {1250, 778, 30, 22}, {0, 0, 1280, 778}, false, {801, 278}},
        {"bottom right, above the item", {1250, 0, 30, 24}, {0, 24, 1280, 776}, false, {801, 24}},
        {"top left, with the left edges together", {100, 778, 30, 22}, {0, 0, 1280, 778}, false, {99, 278}},
        {"side bar at the left, beside it", {0, 400, 40, 22}, {40, 0, 1240, 800}, false, {40, 0}},
        {"side bar at the right, beside it", {1240, 700, 40, 22}, {0, 0, 1240, 800}, false, {760, 200}},
        {"right to left, top left", {0, 778, 30, 22}, {0, 0, 1280, 778}, true, {-1, 278}},
        {"right to left, but at the right", {1250, 778, 30, 22}, {0, 0, 1280, 778}, true, {801, 278}},
        {"screen left of the main one", {-30, 1000, 30, 22}, {-1024, 300, 1024, 722}, false, {-479, 500}},
        {"too low, still not on the item", {1250, 378, 30, 22}, {0, 0, 1280, 378}, false, {801, -122}},
        {"no item yet", {}, {0, 0, 1280, 776}, false, {800, 276}},
        {"right to left, no item yet", {}, {0, 0, 1280, 776}, true, {0, 276}},
    };
    for (const auto& c : cases) {
        const KXRect placed = platform::PlacePanel(hanging(c.item), c.item, c.available, c.rightToLeft);
        EXPECT_EQ(placed, (KXRect{c.placed.x, c.placed.y, 480, 500})) << c.what;
    }
}

TEST(PanelPlacement, LeavesAnItemWithoutABarItsRoom) {
    const KXRect screen{0, 0, 640, 400};
    EXPECT_EQ(platform::RoomAtItem({610, 378, 30, 22}, screen), (KXRect{0, 0, 640, 378}));
    EXPECT_EQ(platform::RoomAtItem({610, 0, 30, 22}, screen), (KXRect{0, 22, 640, 378}));
    EXPECT_EQ(platform::RoomAtItem({610, 400, 30, 22}, screen), screen) << "in a bar above";
    EXPECT_EQ(platform::RoomAtItem({-30, 300, 30, 22}, screen), screen) << "in one at the side";
    EXPECT_EQ(platform::RoomAtItem({}, screen), screen);
}

TEST(PanelPlacement, GuessesTheItemsFrameFromItsClick) {
    const KXRect screen{0, 0, 1280, 800};
    const auto frameAt = [&](std::optional<KXPoint> click, const KXRect& available) {
        return platform::StatusItemFrameAt(click, {30, 22}, screen, available);
    };
    EXPECT_EQ(frameAt({{1000, 790}}, {0, 0, 1280, 774}), (KXRect{985, 774, 30, 26}));
    EXPECT_EQ(frameAt({{1000, 10}}, {0, 32, 1280, 768}), (KXRect{985, 0, 30, 32}));
    EXPECT_EQ(frameAt({{9, 300}}, {40, 0, 1240, 800}), (KXRect{0, 289, 40, 22}));
    EXPECT_EQ(frameAt({{1270, 300}}, {0, 0, 1240, 800}), (KXRect{1240, 289, 40, 22}));
    EXPECT_EQ(frameAt({{500, 300}}, screen), (KXRect{485, 289, 30, 22})) << "a bar that takes no room";
    EXPECT_EQ(frameAt({}, {0, 0, 1280, 774}), (KXRect{1250, 774, 30, 26}));
    EXPECT_EQ(frameAt({}, {0, 32, 1280, 768}), (KXRect{1250, 0, 30, 32}));
    EXPECT_EQ(frameAt({}, screen), (KXRect{1250, 778, 30, 22}));
}

} // namespace
