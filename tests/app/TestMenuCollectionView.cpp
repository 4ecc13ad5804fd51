#include "lib/base/KXNotificationCenter.h"
#include "tests/app/MenuFixtures.h"

#include <gtest/gtest.h>

namespace {

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

    FakeKeys keys;
    ManualMainLoop loop;
    SMMenuCollectionView list{{loop.clock(), loop, keys}};
    int layouts = 0;
};

TEST_F(MenuCollectionView, ScrollsByRowsAndKeepsItsPlaceForNewItems) {
    show(*listTitled(numbered("", 9)));
    EXPECT_EQ(visibleTitles(list), (Titles{"0", "1", "2", "3", "v"}));
    EXPECT_FALSE(list.scrollUp());
    EXPECT_TRUE(list.scrollDown());
    EXPECT_EQ(visibleTitles(list), (Titles{"^", "2", "3", "4", "v"}));
    EXPECT_TRUE(list.scrollDown() && list.scrollDown() && list.scrollDown());
    EXPECT_EQ(visibleTitles(list), (Titles{"^", "5", "6", "7", "8"}));
    EXPECT_FALSE(list.scrollDown());
    show(*listTitled(numbered("new", 20)));
    EXPECT_EQ(list.scrollIndex(), 5U);
    EXPECT_EQ(visibleTitles(list)[1], "new5");
    show(*listTitled(numbered("few", 3)));
    EXPECT_EQ(list.scrollIndex(), 2U);
    EXPECT_TRUE(list.scrollUp());
    EXPECT_EQ(visibleTitles(list), (Titles{"few0", "few1", "few2"}));
}

TEST_F(MenuCollectionView, LaysOutOnceBeforeDrawingOrToBringAnItemIntoView) {
    const auto items = *listTitled(numbered("", 10000));
    show(items);
    list.viewWillDraw();
    EXPECT_EQ(layouts, 1) << "nothing is new";
    EXPECT_EQ(list.menuButtons()[1]->frame(), (KXRect{0, 60, 290, 20}));
    EXPECT_EQ(list.scrollItemToVisible(items[9000].get())->title(), "9000");
    EXPECT_EQ(visibleTitles(list), (Titles{"^", "8998", "8999", "9000", "v"}));
    EXPECT_EQ(list.scrollItemToVisible(items[0].get())->title(), "0");
    EXPECT_EQ(list.scrollIndex(), 0U);
    EXPECT_EQ(list.scrollItemToVisible(itemTitled("stranger").get()), nullptr);
    EXPECT_EQ(layouts, 4) << "one each, however far it was";
}

TEST_F(MenuCollectionView, ScrollsWhileTheMouseRestsOnAnArrowButNotBeforeTheDateGiven) {
    show(*listTitled(numbered("", 30)));
    const auto indexAfter = [this](int time) {
        loop.advance(milliseconds(time));
        return list.scrollIndex();
    };
    const auto holdBack = [this] {
        list.setDelayedScrollTimerFireDate(loop.clock().now() + milliseconds(1000));
    };
    const auto down = list.scrollDownMenuButton();
    down->setHasMouseOver(true);
    EXPECT_EQ(indexAfter(49), 0U);
    EXPECT_EQ(indexAfter(101), 4U) << "two, one, one";
    holdBack();
    EXPECT_EQ(indexAfter(999), 4U) << "a timer that runs waits";
    EXPECT_EQ(indexAfter(1), 5U);
    EXPECT_FALSE(list.delayedScrollTimerFireDate());
    down->setHasMouseOver(false);
    EXPECT_EQ(indexAfter(500), 5U);

    holdBack();
    list.scrollUpMenuButton()->setHasMouseOver(true);
    EXPECT_EQ(indexAfter(999), 5U) << "and so does one that starts";
    EXPECT_EQ(indexAfter(501), 0U);
    EXPECT_FALSE(list.isScrollTimerValid()) << "ends where the list does";
}

TEST_F(MenuCollectionView, LeavesRowsThatOutliveItHarmless) {
    auto mortal =
        std::make_unique<SMMenuCollectionView>(SMMenuCollectionView::Services{loop.clock(), loop, keys});
    mortal->setSize({290, 60});
    mortal->setMenuItems(*listTitled(numbered("", 9)));
    mortal->performLayout();
    const auto row = mortal->menuButtons()[0];
    const auto arrow = mortal->scrollDownMenuButton();
    arrow->setHasMouseOver(true);
    mortal = nullptr;
    for (const auto& button : {row, arrow})
        button->setHasMouseOver(false);
    loop.advance(milliseconds(500));
    EXPECT_EQ(row->superview(), nullptr);
}

TEST_F(MenuCollectionView, ChoosesTheNearestRowWhereDistancesAreSigned) {
    // The centres are at 90, 70, 50 and 30.
    show(*listOf({leafInfo("a"), leafInfo("b"), leafInfo("off", {{"enabled", false}}), leafInfo("c")}));
    for (const float y : {90.0F, 80.0F, 52.0F}) // a row at y does not count, of two the lower one does
        EXPECT_EQ(list.findValidKeyViewNearYPos(y, {}, {})->title(), "b") << y;
    const auto beside = std::make_shared<SMMenuButton>(keys);
    EXPECT_EQ(list.findValidKeyViewNearYPos(20, {}, {beside, 15}), beside);
    EXPECT_EQ(list.findValidKeyViewNearYPos(60, {beside, -30}, {}), beside)
        << "one on the wrong side is nearer than all";
}

} // namespace
