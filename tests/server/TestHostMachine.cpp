#include "server/linux/HostMachine.h"

#include "platform/linux/GioLaunchServices.h"
#include "server/linux/HostCatalogue.h"
#include "server/linux/SpawnedPrograms.h"
#include "tests/support/GuiApplication.h"
#include "tests/support/ScratchComputer.h"

#include <QImage>
#include <future>
#include <gio/gio.h>
#include <gmock/gmock.h>

using namespace tessel;
using testing::ElementsAre;

namespace {

platform::GioLaunchServices launching; // NOLINT(*-non-const-global-variables): it holds nothing

std::string titles(const std::vector<CatalogueItem>& items) {
    std::string result;
    for (const CatalogueItem& item : items)
        result += item.title + ", ";
    return result;
}

} // namespace

TEST(HostMachine, ListsWhatThisDesktopShouldShow) {
    const std::pair<const char*, const char*> entries[] = {
        {"kx-b", "Categories=Qt;Game;Utility;\nName[de]=Bäume\n"},
        {"kx-a", "Categories=Game;\nName=ast\nIcon=kx-icon\n"},
        {"kx-c", "Categories=Unheard;\n"},
        {"kx-d", "Categories=Settings;\nOnlyShowIn=KXTest;\n"},
        {"kx-hidden1", "NoDisplay=true\n"},
        {"kx-hidden2", "OnlyShowIn=Other;\n"},
        {"kx-hidden3", "NotShowIn=KXTest;\n"},
        {"kx-hidden4", "TryExec=/no/such/program\n"},
        {"kx-hidden5", "Hidden=true\n"},
    };
    for (const auto& [id, keys] : entries)
        computer.install(id, keys);
    const Catalogue catalogue = ReadHostCatalogue();
    ASSERT_EQ(titles(catalogue.programs), "Games, Other, Settings, ");
    EXPECT_EQ(titles(catalogue.programs[0].children), "ast, Bäume, ");
    EXPECT_EQ(catalogue.programs[0].children[0].id, "kx-a.desktop");
    EXPECT_EQ(catalogue.programs[0].children[0].icon, "kx-icon");
    EXPECT_EQ(titles(catalogue.topMenu), "Home, Dokumente, Places, , Settings, ");
    EXPECT_EQ(catalogue.topMenu[1].id, "place:file://" + (computer.root / "Dokumente").string());
    EXPECT_THAT(catalogue.frequent, ElementsAre("kx-a.desktop", "kx-b.desktop", "kx-c.desktop"));
}

TEST(HostMachine, ReadsIconsOfTheThemeOnAThreadOfItsOwn) {
    ensureGuiApplication();
    computer.write("config/gtk-3.0/settings.ini", "[Settings]\ngtk-icon-theme-name=KXTheme\n");
    computer.write("data/icons/KXTheme/index.theme", "[Icon Theme]\nName=x\nDirectories=s\n"
                                                     "[s]\nSize=48\nMinSize=1\nMaxSize=256\nType=Scalable\n");
    computer.write(
        "data/icons/KXTheme/s/kx-svg.svg",
        R"(<svg xmlns="http://www.w3.org/2000/svg" viewBox="0 0 1 1"><path d="M0 0h1v1z"/></svg>)");
    QImage green(32, 32, QImage::Format_ARGB32);
    green.fill(QColor(0, 255, 0, 128));
    green.save(QString::fromStdString(computer.root / "loose.png"));
    std::async(std::launch::async, [&] {
        HostMachine machine("host", "This", launching);
        machine.readCatalogue();
        EXPECT_EQ(machine.readIcon("kx-svg").size(), 4u);
        const plist::Value set = machine.readIcon(computer.root / "loose.png");
        ASSERT_EQ(set.size(), 2u) << "never enlarged";
        const plist::Data pixels = set.at(1)["data"].data();
        EXPECT_EQ(std::vector(pixels.data(), pixels.data() + 4),
                  (std::vector{std::byte{0}, std::byte{255}, std::byte{0}, std::byte{128}}));
        for (const char* absent : {"kx-none", "/dev/zero", "/no/such.png"})
            EXPECT_TRUE(machine.readIcon(absent).isNil()) << absent;
    }).get();
}

TEST(HostMachine, TellsOfANewEntryAndLaunchesItOrSaysWhyNot) {
    HostMachine machine("host", "This", launching);
    bool isChanged = false;
    const auto watch = machine.watch([&] { isChanged = true; });
    machine.readCatalogue();
    computer.install("kx-true", "NoDisplay=true\n");
    computer.install("kx-broken", "NoDisplay=true\nExec=/no/such/program\n");
    const auto launch = [&](const std::string& id) {
        std::optional<std::string> result;
        machine.launch({.id = id}, [&](const auto& failure) { result = failure.value_or("started"); });
        while (!result)
            g_main_context_iteration(nullptr, TRUE);
        return *result;
    };
    // The library learns of a new entry from a thread that watches the folder.
    std::string outcome;
    do
        outcome = launch("kx-true.desktop");
    while (outcome == "its desktop entry is gone");
    EXPECT_EQ(outcome, "started");
    while (!isChanged)
        g_main_context_iteration(nullptr, TRUE);
    EXPECT_EQ(launch("kx-gone.desktop"), "its desktop entry is gone");
    EXPECT_NE(launch("kx-broken.desktop"), "started");
    EXPECT_NE(launch("place:kx-unknown://x"), "started");
}

TEST(SpawnedPrograms, StartsAndReaps) {
    SpawnedPrograms programs;
    EXPECT_EQ(programs.reap(programs.start("/bin/false").value()), "exit code 1");
    EXPECT_FALSE(programs.start("/no/such/program"));
}
