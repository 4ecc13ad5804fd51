#include "platform/linux/WindowChoice.h"

#include <gmock/gmock.h>

using namespace platform;
using testing::ElementsAre;

TEST(WindowChoice, PrefersWhatCanBeSeenNow) {
    constexpr bool hidden = true, elsewhere = true, furniture = true;
    const WindowFacts visible{1}, onAnother{2, !hidden, elsewhere}, minimised{3, hidden},
        bar{4, !hidden, !elsewhere, furniture}, above{5};
    const auto raised = [](std::vector<WindowFacts> facts) { return WindowsToRaise(facts); };
    EXPECT_THAT(raised({visible, above}), ElementsAre(1, 5));
    EXPECT_THAT(raised({visible, onAnother, minimised, bar}), ElementsAre(2, 1));
    EXPECT_THAT(raised({minimised, bar}), ElementsAre(3));
    EXPECT_THAT(raised({bar}), ElementsAre());
}

TEST(WindowChoice, WorksOutTheGridOfDesktops) {
    const auto grid = [](std::vector<std::uint32_t> layout, std::uint32_t desktops) {
        const auto found = GridOfDesktops(layout, desktops);
        return std::pair(found.columns, found.rows);
    };
    EXPECT_EQ(grid({}, 4), std::pair(4u, 1u));
    EXPECT_EQ(grid({0, 0, 2}, 5), std::pair(3u, 2u));
    EXPECT_EQ(grid({0, 2, 0, 0}, 5), std::pair(2u, 3u));
    EXPECT_EQ(grid({0, 0, 0, 0}, 0), std::pair(1u, 1u));
    EXPECT_EQ(grid({0, 0xFFFFFFFF, 0}, 0xFFFFFFFF), std::pair(1024u, 1u));
}
