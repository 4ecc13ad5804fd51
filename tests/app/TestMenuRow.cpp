// Where the parts of a row lie, and how high it is, is held to pictures: TestMenuPictures.cpp.

#include "app/SMMenuButton.h"
#include "app/menuRow.h"
#include "tests/app/MenuFixtures.h"

#include <gtest/gtest.h>

namespace {

TEST(MenuRow, IsMirroredPartByPart) {
    for (const auto style : {SMMenuButtonStyleList, SMMenuButtonStyleBack, SMMenuButtonStyleAllPrograms}) {
        MenuRowContent content{style, 0, {290, 20}, true, true, false, {60, 15}, KXSize{8, 15}, 2.0F};
        const auto plain = menuRowGeometry(content);
        content.isMirrored = true;
        const auto mirrored = menuRowGeometry(content);
        for (const auto part : {&MenuRowGeometry::mark, &MenuRowGeometry::arrow, &MenuRowGeometry::icon}) {
            auto expected = plain.*part;
            if (expected) expected->x = 290 - expected->maxX();
            EXPECT_EQ(mirrored.*part, expected) << style;
        }
        EXPECT_EQ(mirrored.title.maxX(), 290 - plain.title.x) << style;
        EXPECT_EQ(mirrored.title.width, 60) << "as wide as the text, so that it ends there";
        EXPECT_NE(mirrored.arrowDirection, plain.arrowDirection) << style;
    }
}

TEST(MenuButton, IsAsHighAsTheAlternateThatShowsWhileOptionIsHeld) {
    FakeKeys keys;
    SMMenuButton button(keys);
    button.setMenuItem(itemTitled("a", {{"altMenuItem", plist::Dictionary{{"separatorItem", true}}}}));
    button.setStyle(SMMenuButtonStyleHome);
    EXPECT_EQ(button.preferredHeight(), 40);
    keys.option = true;
    EXPECT_EQ(button.preferredHeight(), 10);
    button.setStyle(SMMenuButtonStyleLeftPane);
    EXPECT_EQ(button.preferredHeight(), 20) << "the item itself counts there";
}

TEST(MenuButton, StaysDisabledForGood) {
    const FakeKeys keys;
    for (const auto& item : {itemTitled("a", {{"enabled", false}}), SMMenuItem::separatorItem(),
                             SMMenuItem::flexibleSpaceItem()}) {
        SMMenuButton button(keys);
        EXPECT_TRUE(button.isEnabled());
        button.setMenuItem(item);
        EXPECT_FALSE(button.canBecomeKeyView());
        button.setMenuItem(itemTitled("b"));
        EXPECT_FALSE(button.isEnabled());
    }
}

} // namespace
