#include "platform/linux/PlistUserDefaults.h"
#include "tests/support/ScratchHome.h"

#include <gtest/gtest.h>

namespace {

TEST(UserDefaults, FollowTheirFileAndLogABrokenOneOnce) {
    const ScratchHome home;
    const platform::PlistUserDefaults defaults;
    const auto file = home.path() / "Library/Preferences/.GlobalPreferences.plist";
    std::filesystem::create_directories(file.parent_path());
    auto write = [&file, writes = 0](std::string_view contents) mutable {
        std::ofstream(file, std::ios::binary) << contents;
        // Two writes within one tick of the file system must still look like two.
        std::filesystem::last_write_time(file, std::filesystem::file_time_type(std::chrono::hours(++writes)));
    };
    const auto variant = [&] { return defaults.integerForKey("AppleAquaColorVariant"); };
    constexpr auto settings = "<plist><dict><key>AppleAquaColorVariant</key><integer>6</integer>"
                              "<key>x</key><string>6</string></dict></plist>";

    EXPECT_EQ(variant(), 0);
    write(settings);
    EXPECT_EQ(variant(), 6);
    EXPECT_EQ(defaults.integerForKey("x") + defaults.integerForKey("absent"), 0);
    std::filesystem::remove(file);
    EXPECT_EQ(variant(), 0);
    EXPECT_EQ(ScratchHome::logged("\n"), 0) << "a missing file is nothing to report";
    for (const int problems : {1, 2}) {
        write("broken");
        EXPECT_EQ(variant() + variant(), 0);
        EXPECT_EQ(ScratchHome::logged("\n"), problems);
    }
    write(settings);
    EXPECT_EQ(variant(), 6);
}

} // namespace
