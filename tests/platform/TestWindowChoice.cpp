#include "lib/plist/Binary.h"
#include "platform/linux/DockDefaults.h"
#include "platform/linux/WindowChoice.h"
#include "tests/support/ScratchHome.h"

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

TEST(DockDefaults, ComeFromTheDesktopUnlessTheFileSaysWhetherThereAreWorkspaces) {
    const ScratchHome home;
    const auto file = home.path() / "Library/Preferences/com.apple.dock.plist";
    std::filesystem::create_directories(file.parent_path());
    std::optional<DesktopGrid> desktop;
    const DockDefaults dock([&] { return desktop; });
    const auto values = [&] {
        return std::vector{dock.integerForKey("workspaces"), dock.integerForKey("workspaces-cols"),
                           dock.integerForKey("workspaces-rows")};
    };
    EXPECT_THAT(values(), ElementsAre(0, 1, 1));
    desktop = DesktopGrid{3, 2};
    EXPECT_THAT(values(), ElementsAre(1, 3, 2));
    std::string error;
    const auto bytes = plist::WriteBinary(plist::Dictionary{{"workspaces", true}}, error).joined();
    std::ofstream(file).write(reinterpret_cast<const char*>(bytes.data()),
                              static_cast<std::streamsize>(bytes.size()));
    EXPECT_THAT(values(), ElementsAre(1, 0, 0));
}
