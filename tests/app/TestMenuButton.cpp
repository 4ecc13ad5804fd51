#include "app/SMMenuButton.h"
#include "tests/app/MenuFixtures.h"

#include <gtest/gtest.h>

namespace {

struct MenuButton : testing::Test {
    SMMenuButton::Pointer make(std::int32_t style, SMMenuItem::Pointer item = nullptr) {
        auto button = std::make_shared<SMMenuButton>(keys);
        button->setStyle(style);
        if (item) button->setMenuItem(std::move(item));
        return button;
    }
    FakeKeys keys;
};

TEST_F(MenuButton, IsAsHighAsItsStyleAndItemSay) {
    const std::int32_t styles[] = {0, 1, 2, 3, 4, 5, 6, 7};
    const float plain[] = {20, 20, 40, 20, 20, 20, 20, 20};
    const float separator[] = {16, 10, 10, 10, 10, 16, 16, 20};
    for (std::size_t i = 0; i < 8; ++i) {
        EXPECT_EQ(make(styles[i], itemTitled("a"))->preferredHeight(), plain[i]);
        EXPECT_EQ(make(styles[i], SMMenuItem::separatorItem())->preferredHeight(), separator[i]);
        EXPECT_EQ(make(styles[i], SMMenuItem::flexibleSpaceItem())->preferredHeight(), plain[i]);
    }
}

TEST_F(MenuButton, ShowsTheAlternateWhileOptionIsHeld) {
    const auto item =
        itemTitled("Shut Down", {{"altMenuItem", plist::Dictionary{{"title", "Shut Down Now"}}}});
    const auto button = make(SMMenuButtonStyleList, item);
    EXPECT_EQ(button->title(), "Shut Down");
    keys.option = true;
    EXPECT_EQ(button->title(), "Shut Down Now");
    EXPECT_EQ(button->menuItem(), item);
    const plist::Dictionary line{{"separatorItem", true}};
    const auto toLine = itemTitled("a", {{"altMenuItem", line}});
    EXPECT_EQ(make(SMMenuButtonStyleHome, toLine)->preferredHeight(), 10);
    EXPECT_EQ(make(SMMenuButtonStyleLeftPane, toLine)->preferredHeight(), 20)
        << "the item itself counts there";
}

TEST_F(MenuButton, StaysDisabledForGood) {
    for (const auto& item : {itemTitled("a", {{"enabled", false}}), SMMenuItem::separatorItem(),
                             SMMenuItem::flexibleSpaceItem()}) {
        const auto button = make(SMMenuButtonStyleList, item);
        EXPECT_FALSE(button->canBecomeKeyView());
        button->setMenuItem(itemTitled("b"));
        EXPECT_FALSE(button->isEnabled());
        EXPECT_EQ(button->title(), "b");
    }
    EXPECT_TRUE(make(SMMenuButtonStyleList, itemTitled("a"))->isEnabled());
}

} // namespace
