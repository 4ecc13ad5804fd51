#include "tests/app/MenuFixtures.h"

#include <gtest/gtest.h>

namespace {

using std::chrono::milliseconds;

struct MenuWindowController : testing::Test, MenuWorld {
    MenuWindowController() {
        owner.contents.topMenu =
            listOf({leafInfo("Documents"), folderInfo("Computer", {leafInfo("Disk C")})});
        owner.contents.bottomMenu = listTitled({"Run"});
        owner.contents.pinnedApps = listTitled({"Mail"});
        owner.contents.frequentlyUsedApps = listTitled({"Paint", "Chess"});
        owner.contents.searchableApps = listTitled(numbered("App ", 40));
        owner.contents.allProgramsMenu = SMMenuItem::initWithSubmenu(
            *listOf({folderInfo("Games", {folderInfo("Cards", {leafInfo("Solitaire")}), leafInfo("Mines")}),
                     leafInfo("Notes")}));
        owner.contents.nameList = {"one", "two"};
        owner.contents.selectedIndex = 1;
        open();
    }
    const Titles home{"Mail", "|", "Chess", "Paint"};
};

TEST_F(MenuWindowController, OpensAtHomeSizedToTheScreen) {
    EXPECT_EQ(rightTitles(), home);
    EXPECT_EQ(menu->actionButton()->title(), "All Programs");
    EXPECT_EQ(menu->frame().height, 550);
    EXPECT_EQ(titlesOf(outlets->left->menuItems()), (Titles{"Documents", "Computer", "", "Run"}));
    EXPECT_EQ(outlets->machines, owner.contents.nameList);
    EXPECT_EQ(outlets->selectedMachine, 1);
}

TEST_F(MenuWindowController, ActsOnALeafAndCloses) {
    outlets->events->mouseDown(centerOf("Chess"));
    outlets->events->mouseUp(centerOf("Paint"));
    click(KXPoint{5, 300}); // the flexible space
    EXPECT_TRUE(owner.log.empty()) << "needs press and release on the same enabled row";
    click("Chess");
    EXPECT_EQ(owner.log, (Titles{"action Chess", "close"}));
    EXPECT_FALSE(menu->isVisible());
}

TEST_F(MenuWindowController, OpensAFolderOfTheLeftPaneAndReturns) {
    click("Computer");
    EXPECT_EQ(rightTitles(), Titles{"Disk C"});
    EXPECT_EQ(menu->actionButton()->title(), "Back");
    EXPECT_TRUE(menu->currentMenuButton()->highlighted());
    EXPECT_EQ(outlets->animations.back(), SMMenuAnimationForward);

    const auto button = menu->currentMenuButton();
    click("Computer");
    EXPECT_EQ(rightTitles(), home);
    EXPECT_FALSE(button->highlighted());
    EXPECT_EQ(menu->currentMenuButton(), nullptr);
    EXPECT_EQ(outlets->animations.back(), SMMenuAnimationBack);
}

TEST_F(MenuWindowController, UnfoldsFoldersOfAllProgramsInPlace) {
    clickAction();
    const auto slides = outlets->animations.size();
    click("Games");
    click("Cards");
    EXPECT_EQ(visibleTitles(*outlets->right), (Titles{"|", "Games", "Cards", "Solitaire", "Mines", "Notes"}));
    EXPECT_EQ(outlets->right->menuButtons()[3]->indentation(), 2);
    click("Cards");
    EXPECT_EQ(visibleTitles(*outlets->right), (Titles{"|", "Games", "Cards", "Mines", "Notes"}));
    EXPECT_EQ(outlets->animations.size(), slides);
    clickAction();
    EXPECT_EQ(rightTitles(), home);
}

TEST_F(MenuWindowController, KeepsASearchForThirtySecondsAndAFolderNotAtAll) {
    const auto reopenAfter = [&](milliseconds time) {
        menu->hideMenuWindow();
        loop.advance(time);
        menu->showMenuWindow();
        display();
        return menu->searchState();
    };
    type("app 3");
    EXPECT_EQ(reopenAfter(std::chrono::seconds(30)), SMMenuStateSearch);
    EXPECT_EQ(outlets->search, "app 3");
    menu->hideMenuWindow();
    loop.advance(std::chrono::seconds(29));
    EXPECT_EQ(reopenAfter(std::chrono::seconds(29)), SMMenuStateSearch) << "the last close call counts";
    EXPECT_EQ(reopenAfter(milliseconds(30001)), SMMenuStateHome);
    EXPECT_EQ(outlets->search, "");
    clickAction();
    EXPECT_EQ(reopenAfter(milliseconds(1)), SMMenuStateHome);
}

TEST_F(MenuWindowController, ReloadsInTheStateItIsIn) {
    type("app 1");
    owner.contents.searchableApps = listTitled({"App 1 new"});
    menu->reloadData();
    display();
    EXPECT_EQ(rightTitles(), Titles{"App 1 new"});
    EXPECT_EQ(highlighted(), "App 1 new");

    type("");
    clickAction();
    menu->reloadData();
    EXPECT_TRUE(rightTitles().empty()) << "an open folder is forgotten, its state is not";
    EXPECT_EQ(menu->actionButton()->title(), "Back");
}

TEST_F(MenuWindowController, FindsTheHighlightAgainInNewRows) {
    outlets->events->mouseMoved(centerOf("Paint"));
    const auto old = menu->currentMouseOverMenuButton();
    outlets->right->setMenuItems(outlets->right->menuItems());
    display();
    EXPECT_EQ(highlighted(), "Paint");
    EXPECT_NE(menu->currentMouseOverMenuButton(), old);
    outlets->right->setMenuItems(*listTitled({"other"}));
    display();
    EXPECT_EQ(highlighted(), "none");
}

TEST_F(MenuWindowController, ScrollsTheRightListByTheWheelWhereverItTurns) {
    type("app");
    const KXPoint overLeft{20, 300};
    outlets->events->scrollWheel(0.005, overLeft);
    EXPECT_EQ(outlets->right->scrollIndex(), 0U);
    outlets->events->scrollWheel(-1, overLeft); // ln 2 rounds to 1: two steps
    EXPECT_EQ(outlets->right->scrollIndex(), 3U);
    EXPECT_TRUE(outlets->right->delayedScrollTimerFireDate());
    outlets->events->scrollWheel(-10, overLeft); // ln 11 rounds to 2
    EXPECT_EQ(outlets->right->scrollIndex(), 6U);
    outlets->events->scrollWheel(1000, overLeft);
    EXPECT_EQ(outlets->right->scrollIndex(), 0U);
}

} // namespace
