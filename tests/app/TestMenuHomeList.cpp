#include "app/menuHomeList.h"
#include "tests/app/MenuFixtures.h"

#include <gtest/gtest.h>

namespace {

TEST(MenuHomeList, SizesTheWindowByWholeRows) {
    EXPECT_EQ(menuWindowHeight(400, 200, 800), 670) << "eleven rows at most";
    EXPECT_EQ(menuWindowHeight(400, 200, 100), 270) << "one at least, also when not even that fits";
    EXPECT_EQ(menuWindowHeight(400, 200, 429), 390);
}

TEST(MenuHomeList, TakesPinnedThenFrequentlyUsedByTitleWithoutCase) {
    const auto home = [](const Titles& pinned, const Titles& frequent, float height) {
        SMMenuModel model;
        if (!pinned.empty()) model.pinnedApps = listTitled(pinned);
        model.frequentlyUsedApps = listTitled(frequent);
        return titlesOf(pinnedAndFrequentlyUsedApps(model, height));
    };
    const Titles pinned = {"Zoo", "Mail", "Browser"};
    const Titles frequent = {"Ö2", "B", "ö1", "a", "never", "shown"};
    EXPECT_EQ(home(pinned, frequent, 300), (Titles{"Zoo", "Mail", "Browser", "|", "a", "B", "ö1", "Ö2"}));
    EXPECT_EQ(home(pinned, frequent, 140), pinned) << "no separator hangs below";
    EXPECT_EQ(home(pinned, frequent, 60), Titles{"Zoo"});
    EXPECT_EQ(home(pinned, frequent, 10), Titles{});
    EXPECT_EQ(home({}, {"b", "a"}, 300), (Titles{"a", "b"})) << "nothing to separate";
    EXPECT_EQ(home(pinned, {}, 300), pinned);
}

} // namespace
