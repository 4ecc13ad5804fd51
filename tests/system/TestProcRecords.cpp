#include "platform/linux/ProcRecords.h"

#include <gmock/gmock.h>

using namespace platform;

TEST(ProcRecords, StatIsReadBehindTheLastParenthesis) {
    const auto stat = ParseProcStat("12 (a) S 1 (b) c) R 34 12 12 0 -1 4194304 1 2 3 4 5 6 7 8 20 0 1 0 "
                                    "4294967301 1000 10 18446744073709551615\n");
    ASSERT_TRUE(stat);
    EXPECT_EQ(stat->state, 'R');
    EXPECT_EQ(stat->parent, 34);
    EXPECT_EQ(stat->startTicks, 4294967301u);
    EXPECT_FALSE(stat->hasEnded());
    for (const char* text : {"", "12", "12 (a", "12 (a) ", "12 (a) R 34",
                             "12 (a) RR 34 12 12 0 -1 4194304 1 2 3 4 5 6 7 8 20 0 1 0 99 1000",
                             "12 (a) R x 12 12 0 -1 4194304 1 2 3 4 5 6 7 8 20 0 1 0 99 1000",
                             "12 (a) R 34 12 12 0 -1 4194304 1 2 3 4 5 6 7 8 20 0 1 0 -99 1000"})
        EXPECT_FALSE(ParseProcStat(text)) << text;
}

TEST(ProcRecords, TheControlGroupIsSystemdsOfEitherHierarchy) {
    EXPECT_EQ(SystemdControlGroup("0::/user.slice/app-a-1.scope\n"), "/user.slice/app-a-1.scope");
    EXPECT_EQ(SystemdControlGroup("9:cpu,cpuacct:/x\n1:name=systemd:/a:b\n0::/u\n"), "/a:b");
    for (const char* text : {"", "\n", "0", "0:", "9:cpu:/x\n"})
        EXPECT_EQ(SystemdControlGroup(text), "") << text;
}

TEST(ProcRecords, ApplicationUnitsNameTheirApplication) {
    const std::pair<const char*, const char*> cases[] = {
        {"/user.slice/app.slice/app-gnome-org.example.Edit-1234.scope", "org.example.Edit"},
        {"/app.slice/app-org.example.Edit-9f3a.scope", "org.example.Edit"},
        {"/app.slice/app-org.example.Edit@9f3a.service", "org.example.Edit"},
        {"/app.slice/app-kde-org.example.Edit@autostart.service", "org.example.Edit"},
        {"/app.slice/app-org.example.Edit.service", "org.example.Edit"},
        {R"(/app.slice/app-gnome-my\x2dold\x2deditor-1.scope)", "my-old-editor"},
        {"/app.slice/app-gnome-org.example.Edit-1.scope/worker/a.scope", "org.example.Edit"},
    };
    for (const auto& [path, id] : cases)
        EXPECT_EQ(ApplicationIDOfControlGroup(path), id) << path;
    for (const char* none :
         {"/app.slice/app-gnome-a-b-c-1.scope", "/app.slice/app-1.scope", "/app.slice/app--1.scope",
          R"(/app.slice/app-\x2fetc-1.scope)", "/app.slice/app-gnome-org.example.Edit.slice",
          "/session.slice/dbus.service", "/", ""})
        EXPECT_FALSE(ApplicationIDOfControlGroup(none)) << none;
    EXPECT_EQ(UnescapeUnitName(R"(\x2\xzz\x41\)"), R"(\x2\xzzA\)");
}
