#include "platform/linux/DesktopEntry.h"

#include <gmock/gmock.h>

using namespace platform;
using testing::ElementsAre;
using testing::Pair;

TEST(DesktopEntry, ProgramsOfExec) {
    const std::pair<const char*, const char*> cases[] = {
        {"edit %F", "edit"},
        {"  /opt/a/edit --new-window", "/opt/a/edit"},
        {R"("/opt/my app/edit" %U)", "/opt/my app/edit"},
        {R"("/opt/\\$x\\"y")", R"(/opt/$x"y)"},
        {R"(/opt/my\sapp)", "/opt/my"},
        {"env LANG=C A=B edit", "edit"},
        {"/usr/bin/env edit", "edit"},
    };
    for (const auto& [exec, program] : cases)
        EXPECT_EQ(ProgramOfExec(exec), program) << exec;
    for (const char* none : {"env -u LANG edit", "env A=B", "sh -c 'edit'",
                             "/usr/bin/flatpak run org.example.Edit", "\"edit", "edit\"x", ""})
        EXPECT_EQ(ProgramOfExec(none), "") << none;
}

TEST(DesktopEntry, OnlyTheEntrysOwnGroupCountsAndNamesItsProgram) {
    const auto entry = ParseDesktopEntry("# text\n[Desktop Entry]\r\nType = Application\nExec[de]=nein\n"
                                         "junk\nExec=edit %F\nExec=second\nNoDisplay=true\n\n"
                                         "[Desktop Action new]\nExec=other\nHidden=true\n");
    ASSERT_TRUE(entry);
    EXPECT_EQ(entry->program, "edit");
    EXPECT_TRUE(entry->noDisplay);
    const std::string head = "[Desktop Entry]\nType=Application\n";
    EXPECT_EQ(ParseDesktopEntry(head + "TryExec=/opt/edit\nExec=sh -c edit")->program, "/opt/edit");
    EXPECT_EQ(ParseDesktopEntry(head + "DBusActivatable=true\n")->program, "");
}

TEST(DesktopEntry, OtherTextsAreNone) {
    for (const char* text : {"", "Type=Application\nExec=a\n", "[Desktop Entry]\nType=Link\n",
                             "[Desktop Entry\nType=Application\nExec=a\n", "[X]\nType=Application\nExec=a\n",
                             "[Desktop Entry]\nType=Application\nExec=a\nHidden=true\n"})
        EXPECT_FALSE(ParseDesktopEntry(text)) << text;
    EXPECT_THAT(KeyFileGroup("[A]\n=\n==b\na=\n[B]\nc=d", "A"), ElementsAre(Pair("", ""), Pair("a", "")));
}
