#include "lib/base/KXNotificationCenter.h"
#include "tests/app/MenuFixtures.h"

#include <gtest/gtest.h>

namespace {

using Titles = std::vector<std::string>;
using std::chrono::milliseconds;

struct MenuCollectionView : testing::Test {
    MenuCollectionView() {
        list.setStyle(SMMenuButtonStyleList);
        list.setSize({290, 100});
        KXNotificationCenter::defaultCenter().addObserver(this, SMMenuCollectionViewDidUpdateNotification,
                                                          &list,
                                                          [this](const KXNotification&) { ++layouts; });
    }
    ~MenuCollectionView() override { KXNotificationCenter::defaultCenter().removeObserver(this); }
    void show(SMMenuItems items) {
        list.setMenuItems(std::move(items));
        list.viewWillDraw();
    }
    /// The tree "a", folder "f" over "g" over "leaf", "z".
    SMMenuItem::Pointer tree() {
        return SMMenuItem::initWithDictionary(folderInfo(
            "root", {leafInfo("a"), folderInfo("f", {leafInfo("b"), folderInfo("g", {leafInfo("leaf")})}),
                     leafInfo("z")}));
    }

    FakeKeys keys;
    ManualMainLoop loop;
    SMMenuCollectionView list{{loop.clock(), loop, keys}};
    int layouts = 0;
};

TEST_F(MenuCollectionView, LaysOutOnceBeforeDrawingAndTellsOfEveryLayout) {
    list.setMenuItems(itemsTitled({"a", "b"}));
    EXPECT_TRUE(list.menuButtons().empty());
    list.viewWillDraw();
    list.viewWillDraw();
    EXPECT_EQ(layouts, 1);
    list.performLayout();
    EXPECT_EQ(layouts, 2);
    EXPECT_EQ(visibleTitles(list), (Titles{"a", "b"}));
    EXPECT_EQ(list.menuButtons()[1]->frame(), (KXRect{0, 60, 290, 20}));
}

TEST_F(MenuCollectionView, UnfoldsTheChainToTheExpandedItem) {
    const auto root = tree();
    const auto folder = root->submenu()->at(1);
    const auto inner = folder->submenu()->at(1);
    list.setSize({290, 400});
    show(*root->submenu());
    EXPECT_EQ(visibleTitles(list), (Titles{"a", "f", "z"}));
    list.setExpandedMenuItem(inner);
    list.viewWillDraw();
    EXPECT_EQ(visibleTitles(list), (Titles{"a", "f", "b", "g", "leaf", "z"}));
    EXPECT_EQ(list.menuButtons()[4]->indentation(), 2);
    EXPECT_EQ(list.menuButtons()[5]->indentation(), 0);
    list.setExpandedMenuItem(folder);
    list.viewWillDraw();
    EXPECT_EQ(visibleTitles(list), (Titles{"a", "f", "b", "g", "z"}));
}

TEST_F(MenuCollectionView, ScrollsByRowsAndKeepsItsPlaceForNewItems) {
    show(itemsTitled(numbered("", 9)));
    EXPECT_EQ(visibleTitles(list), (Titles{"0", "1", "2", "3", "v"}));
    EXPECT_FALSE(list.scrollUp());
    EXPECT_TRUE(list.scrollDown());
    EXPECT_EQ(visibleTitles(list), (Titles{"^", "2", "3", "4", "v"}));
    EXPECT_TRUE(list.scrollDown() && list.scrollDown() && list.scrollDown());
    EXPECT_EQ(visibleTitles(list), (Titles{"^", "5", "6", "7", "8"}));
    EXPECT_FALSE(list.scrollDown());
    show(itemsTitled(numbered("new", 20)));
    EXPECT_EQ(list.scrollIndex(), 5U);
    EXPECT_EQ(visibleTitles(list)[1], "new5");
    show(itemsTitled(numbered("few", 3)));
    EXPECT_EQ(list.scrollIndex(), 2U);
    EXPECT_TRUE(list.scrollUp());
    EXPECT_EQ(visibleTitles(list), (Titles{"few0", "few1", "few2"}));
}

TEST_F(MenuCollectionView, BringsAnItemIntoView) {
    const auto items = itemsTitled(numbered("", 10000));
    list.setMenuItems(items);
    EXPECT_EQ(list.scrollItemToVisible(items[9000].get())->title(), "9000");
    EXPECT_EQ(visibleTitles(list), (Titles{"^", "8998", "8999", "9000", "v"}));
    EXPECT_EQ(list.scrollItemToVisible(items[0].get())->title(), "0");
    EXPECT_EQ(list.scrollIndex(), 0U);
    EXPECT_EQ(list.scrollItemToVisible(itemTitled("stranger").get()), nullptr);
    EXPECT_EQ(layouts, 3) << "one each, however far it was";
}

TEST_F(MenuCollectionView, ScrollsWhileTheMouseRestsOnAnArrow) {
    show(itemsTitled(numbered("", 30)));
    const auto down = list.scrollDownMenuButton();
    down->setHasMouseOver(true);
    loop.advance(milliseconds(49));
    EXPECT_EQ(list.scrollIndex(), 0U);
    loop.advance(milliseconds(101));
    EXPECT_EQ(list.scrollIndex(), 4U) << "two, one, one";
    down->setHasMouseOver(false);
    loop.advance(milliseconds(500));
    EXPECT_EQ(list.scrollIndex(), 4U);

    list.scrollUpMenuButton()->setHasMouseOver(true);
    loop.advance(milliseconds(500));
    EXPECT_EQ(list.scrollIndex(), 0U);
    EXPECT_FALSE(list.isScrollTimerValid()) << "ends where the list does";
}

TEST_F(MenuCollectionView, HoldsHoverScrollingBackUntilTheDateGiven) {
    show(itemsTitled(numbered("", 90)));
    const auto inOneSecond = [&] { return loop.clock().now() + std::chrono::seconds(1); };
    list.setDelayedScrollTimerFireDate(inOneSecond());
    list.scrollDownMenuButton()->setHasMouseOver(true);
    loop.advance(milliseconds(999));
    EXPECT_EQ(list.scrollIndex(), 0U);
    loop.advance(milliseconds(51));
    EXPECT_EQ(list.scrollIndex(), 3U);
    EXPECT_FALSE(list.delayedScrollTimerFireDate());

    list.setDelayedScrollTimerFireDate(inOneSecond()); // a running timer waits too
    loop.advance(milliseconds(999));
    EXPECT_EQ(list.scrollIndex(), 3U);
    loop.advance(milliseconds(1));
    EXPECT_EQ(list.scrollIndex(), 4U);
}

TEST_F(MenuCollectionView, LeavesRowsThatOutliveItHarmless) {
    auto mortal =
        std::make_unique<SMMenuCollectionView>(SMMenuCollectionView::Services{loop.clock(), loop, keys});
    mortal->setSize({290, 60});
    mortal->setMenuItems(itemsTitled(numbered("", 9)));
    mortal->performLayout();
    const auto row = mortal->menuButtons()[0];
    const auto arrow = mortal->scrollDownMenuButton();
    arrow->setHasMouseOver(true);
    mortal = nullptr;
    row->setHasMouseOver(false);
    arrow->setHasMouseOver(false);
    loop.advance(milliseconds(500));
    EXPECT_EQ(row->superview(), nullptr);
}

TEST_F(MenuCollectionView, ChoosesTheNearestRowWhereDistancesAreSigned) {
    auto items = itemsTitled({"a", "b", "off", "c"}); // centres at 90, 70, 50, 30
    items[2] = itemTitled("off", {{"enabled", false}});
    show(items);
    const auto nearest = [&](float y) {
        const auto button = list.findValidKeyViewNearYPos(y, {}, {});
        return button ? button->title() : "none";
    };
    EXPECT_EQ(nearest(90), "b") << "a centre at y itself does not count";
    EXPECT_EQ(nearest(80), "b") << "a tie goes down";
    EXPECT_EQ(nearest(52), "b") << "disabled rows are passed over";

    const auto beside = std::make_shared<SMMenuButton>(keys);
    beside->setTitle("beside");
    EXPECT_EQ(list.findValidKeyViewNearYPos(20, {}, {beside, 15})->title(), "beside");
    EXPECT_EQ(list.findValidKeyViewNearYPos(60, {beside, -30}, {})->title(), "beside")
        << "one on the wrong side is nearer than all";
}

} // namespace
