#include "app/menuHomeList.h"
#include "tests/app/MenuFixtures.h"

#include <gtest/gtest.h>

namespace {

using Titles = std::vector<std::string>;

TEST(MenuHomeList, SizesTheWindowByWholeRows) {
    EXPECT_EQ(menuWindowHeight(400, 200, 800), 670) << "eleven rows at most";
    EXPECT_EQ(menuWindowHeight(400, 200, 250), 270) << "one at least";
    EXPECT_EQ(menuWindowHeight(400, 200, 100), 270) << "also when not even that fits";
    EXPECT_EQ(menuWindowHeight(400, 200, 429), 390);
    EXPECT_EQ(menuWindowHeight(670, 470, 800), 670) << "again the same";
}

TEST(MenuHomeList, TakesPinnedThenFrequentlyUsedByTitle) {
    SMMenuModel model;
    model.pinnedApps = listTitled({"Zoo", "Mail", "Browser"});
    model.frequentlyUsedApps = listTitled({"d", "B", "c", "A", "never", "shown"});
    EXPECT_EQ(titlesOf(pinnedAndFrequentlyUsedApps(model, 300)),
              (Titles{"Zoo", "Mail", "Browser", "|", "A", "B", "c", "d"}));

    // Room for three: the pinned ones fill it, and no separator hangs below them.
    EXPECT_EQ(titlesOf(pinnedAndFrequentlyUsedApps(model, 140)), (Titles{"Zoo", "Mail", "Browser"}));
    EXPECT_EQ(titlesOf(pinnedAndFrequentlyUsedApps(model, 60)), (Titles{"Zoo"}));
    EXPECT_TRUE(pinnedAndFrequentlyUsedApps(model, 10).empty());
}

TEST(MenuHomeList, NeedsNoSeparatorForOneKindAlone) {
    SMMenuModel model;
    model.frequentlyUsedApps = listTitled({"b", "a"});
    EXPECT_EQ(titlesOf(pinnedAndFrequentlyUsedApps(model, 300)), (Titles{"a", "b"}));
    model.pinnedApps = listTitled({"p"});
    model.frequentlyUsedApps = listTitled({});
    EXPECT_EQ(titlesOf(pinnedAndFrequentlyUsedApps(model, 300)), (Titles{"p"}));
}

} // namespace
