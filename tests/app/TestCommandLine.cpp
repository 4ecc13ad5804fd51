#include "app/SMOptions.h"
#include "app/doctorReport.h"

#include <gmock/gmock.h>

using testing::ContainsRegex;

TEST(CommandLine, TakesOneOptionThatItKnows) {
    std::string error;
    const char* words[] = {"--toggle", "--toggle"};
    const std::span<const char* const> twice = words;
    EXPECT_EQ(SMParseArguments({}, error), SMCommand::run);
    EXPECT_EQ(SMParseArguments(twice.first(1), error), SMCommand::toggle);
    EXPECT_EQ(error, "");
    EXPECT_FALSE(SMParseArguments(twice, error));
    EXPECT_EQ(error, "more than one option");
    words[0] = "--Toggle";
    EXPECT_FALSE(SMParseArguments(twice.first(1), error));
}

TEST(Doctor, HelpsWithFaultsAndOnlyWithThem) {
    SMFindings findings;
    auto& display = findings.display;
    display.name = ":1";
    display.answers = display.isUnderWayland = display.hasNotifierHost = display.isCompositing = true;
    findings.log.path = "/log";
    findings.serverRuns = true;
    const auto well = SMReportOf(findings);
    EXPECT_TRUE(well.isHealthy);
    EXPECT_THAT(well.text, testing::Not(testing::HasSubstr("FAULT")));
    EXPECT_THAT(well.text, ContainsRegex("tray host +ok +bar for status notifier items\n"));
    EXPECT_THAT(well.text, ContainsRegex("blur +ok +none: programs may not see"));

    display.answers = false;
    findings.portDirectory = {"/run/ports", "belongs to user 7"};
    findings.log.fault = "No space left on device";
    const auto ill = SMReportOf(findings);
    EXPECT_FALSE(ill.isHealthy);
    EXPECT_THAT(ill.text, ContainsRegex("display +FAULT +X server :1 does not answer\n +Is .DISPLAY"));
    EXPECT_THAT(ill.text,
                ContainsRegex("runtime directory +FAULT +/run/ports: belongs to user 7 .*not set.*\n +It"));
    EXPECT_THAT(ill.text, ContainsRegex("log +FAULT +/log: No space left on device\n +The menu works"));
}
