#include "server/Options.h"
#include "server/Record.h"
#include "tests/support/ScratchHome.h"

#include <gmock/gmock.h>

using namespace tessel;

TEST(Options, ReadsEveryOptionAndRefusesTheRest) {
    const char* all[] = {"--no-agent", "--show", "--record", "file", "--machine", "sample", "--select", "1"};
    std::string error;
    const auto options = ParseOptions(all, error);
    ASSERT_TRUE(options) << error;
    EXPECT_TRUE(!options->startAgent && options->show && !options->help && !options->version);
    EXPECT_EQ(options->record + *options->machine, "filesample");
    EXPECT_EQ(options->select, 1u);
    EXPECT_TRUE(ParseOptions({}, error)->startAgent);
    using Words = std::vector<const char*>;
    for (const Words& bad : {Words{"--select", "-1"}, Words{"--select", "1x"}, Words{"--record"},
                             Words{"--record", ""}, Words{"--hel"}, Words{""}}) {
        EXPECT_FALSE(ParseOptions(bad, error)) << bad.front();
        EXPECT_NE(error, "");
    }
}

TEST(Record, WritesOneBoundedLineForEachMessage) {
    const ScratchHome home;
    const plist::Value menu = plist::Dictionary{{"topMenu", plist::Array{plist::Dictionary{}, 1}}};
    const plist::Dictionary update{
        {"menu", menu}, {"nameList", plist::Array{"a", "b"}}, {"selectedIndex", 1}};
    EXPECT_EQ(DigestLine("sent", KXIPCMessage("menu.update", std::nullopt, update)),
              R"(menu.update sent {"menu": {"topMenu": 2}, "nameList": ["a", "b"], "selectedIndex": 1})");
    EXPECT_EQ(DigestLine("received", KXIPCMessage("n", std::nullopt, nullptr)), "n received {}");
    plist::Value nested = plist::Array{};
    for (int i = 0; i < 400; ++i)
        nested =
            plist::Dictionary{{std::string(1000, 'k'), nested}, {"q\"\n", std::string(150, '\xc3') + "é"}};
    const std::string line = DigestLine("received", KXIPCMessage("menu.onAction", std::nullopt, nested));
    EXPECT_LT(line.size(), 3000u);
    EXPECT_THAT(line, testing::HasSubstr("q\\\"\\u000a"));
    EXPECT_EQ(line.find('\n'), line.npos);
    EXPECT_FALSE(Record().open((home.path() / "no" / "where").string()));
}
