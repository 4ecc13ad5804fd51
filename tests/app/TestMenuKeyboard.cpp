#include "tests/app/MenuFixtures.h"

#include <gtest/gtest.h>
#include <random>

namespace {

using enum SMEditingCommand;

struct MenuKeyboard : testing::Test, MenuWorld {
    MenuKeyboard() {
        owner.contents.topMenu = listOf({leafInfo("Documents"), leafInfo("off", {{"enabled", false}}),
                                         leafInfo("", {{"separatorItem", true}}), leafInfo("Help")});
        owner.contents.pinnedApps = listTitled({"Mail", "Web"});
        owner.contents.searchableApps = listTitled({"Zebra", "apple", "Éditeur", "Mail"});
        open();
    }
};

TEST_F(MenuKeyboard, FiltersWhileTypingAndPreselectsTheFirst) {
    type("  e ");
    EXPECT_EQ(rightTitles(), (Titles{"Zebra", "apple", "Éditeur"}));
    EXPECT_EQ(highlighted(), "Zebra");
    const auto list = outlets->right;
    type("ed");
    EXPECT_EQ(outlets->right, list) << "the same list goes on";
    EXPECT_EQ(highlighted(), "Éditeur");
    EXPECT_EQ(outlets->results, 1U);
    EXPECT_TRUE(press(insertNewline));
    EXPECT_EQ(owner.log, (Titles{"action Éditeur", "close"}));
}

TEST_F(MenuKeyboard, EscapeOrBlanksLeaveTheSearchAndEscapeThenCloses) {
    const auto list = outlets->right;
    type("   ");
    EXPECT_EQ(outlets->right, list) << "blanks alone search for nothing";
    EXPECT_EQ(outlets->search, "   ");
    const std::function<void()> waysHome[] = {[this] { type("  "); }, [this] { press(cancelOperation); }};
    for (const auto& goHome : waysHome) {
        type("e");
        goHome();
        EXPECT_EQ(outlets->search, "");
        EXPECT_FALSE(outlets->results) << "there is no search";
        EXPECT_EQ(rightTitles(), (Titles{"Mail", "Web"}));
    }
    EXPECT_TRUE(owner.log.empty());
    EXPECT_TRUE(press(cancelOperation));
    EXPECT_EQ(owner.log, Titles{"close"});
}

TEST_F(MenuKeyboard, WalksRoundThePanesOverEnabledRows) {
    Titles walked;
    for (int i = 0; i < 7; ++i) {
        EXPECT_TRUE(press(moveDown));
        walked.push_back(highlighted());
        EXPECT_EQ(outlets->reported, highlighted());
    }
    const std::string settings = menu->settingsButton()->title();
    EXPECT_EQ(walked, (Titles{"Documents", "Help", settings, "All Programs", "Mail", "Web", "Web"}));
    for (auto title = walked.rbegin() + 2; title != walked.rend(); ++title) {
        press(moveUp);
        EXPECT_EQ(highlighted(), *title);
    }
    press(moveUp);
    EXPECT_EQ(highlighted(), "Documents") << "the search field ends the walk";
}

TEST_F(MenuKeyboard, DoesNothingWithoutAHighlight) {
    EXPECT_TRUE(press(moveUp));
    EXPECT_TRUE(press(insertNewline));
    EXPECT_TRUE(press(insertTab));
    EXPECT_FALSE(press(moveRight));
    EXPECT_EQ(highlighted(), "none");
    EXPECT_TRUE(owner.log.empty());
    outlets->events->mouseMoved(centerOf("off"));
    press(insertNewline);
    EXPECT_TRUE(owner.log.empty()) << "nor on a disabled row";
}

TEST_F(MenuKeyboard, JumpsBetweenThePanesAtTheSameHeightWithoutText) {
    press(moveDown);
    EXPECT_FALSE(press(moveLeft)) << "is there already";
    EXPECT_TRUE(press(moveRight));
    EXPECT_EQ(highlighted(), "All Programs");
    outlets->events->mouseMoved(centerOf("Web"));
    EXPECT_TRUE(press(moveLeft));
    EXPECT_EQ(highlighted(), "Help");
    EXPECT_TRUE(press(moveRight));
    EXPECT_EQ(highlighted(), "Mail");
    type("mail");
    EXPECT_FALSE(press(moveLeft)) << "moves the caret";
}

TEST_F(MenuKeyboard, ReachesEveryRowByDownAlone) {
    std::mt19937 random(5);
    for (int round = 0; round < 60; ++round) {
        std::vector<plist::Value> rows;
        Titles reachable;
        for (auto n = 1 + random() % 50; n > 0; --n) {
            const auto kind = random() % 8;
            const std::string title = std::to_string(n);
            rows.push_back(leafInfo(title, {{"separatorItem", kind == 0}, {"enabled", kind > 1}}));
            if (kind > 1) reachable.push_back(title);
        }
        owner.contents.allProgramsMenu = SMMenuItem::initWithSubmenu(*listOf(rows));
        menu->setFrame({0, 0, 480, static_cast<float>(160 + random() % 500)});
        menu->showMenuWindow(); // which leaves the last folder
        clickAction();
        for (const std::string& title : reachable) {
            press(moveDown);
            ASSERT_EQ(highlighted(), title);
            ASSERT_FALSE(menu->currentMouseOverMenuButton()->isHidden());
        }
        for (auto title = reachable.rbegin(); title != reachable.rend(); ++title) {
            ASSERT_EQ(highlighted(), *title);
            press(moveUp);
        }
        ASSERT_EQ(highlighted(), "Back");
    }
}

TEST_F(MenuKeyboard, ActsOnTheItemEvenWhileItsAlternateShows) {
    owner.contents.pinnedApps = listOf({leafInfo("Open", {{"altMenuItem", leafInfo("Open as root")}})});
    menu->reloadData();
    display();
    keys.option = true;
    outlets->events->mouseMoved(centerOf("Open as root"));
    press(insertNewline);
    EXPECT_EQ(owner.log.front(), "action Open");
}

} // namespace
