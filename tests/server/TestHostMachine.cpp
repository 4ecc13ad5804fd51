#include "server/linux/HostMachine.h"

#include "server/linux/HostCatalogue.h"
#include "server/linux/SpawnedPrograms.h"

#include <QGuiApplication>
#include <QImage>

#include <gio/gio.h>
#include <gmock/gmock.h>
#include <sys/stat.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <future>

using namespace tessel;
using testing::ElementsAre;

namespace {

namespace fs = std::filesystem;

/// A computer of its own: GLib reads where things lie once, so it stands before all else.
struct Computer {
    Computer() {
        std::string path = fs::temp_directory_path() / "kx-host-XXXXXX";
        root = mkdtemp(path.data());
        const std::pair<const char*, std::string> variables[] = {
            {"HOME", root},
            {"XDG_DATA_HOME", root / "data"},
            {"XDG_DATA_DIRS", root / "system"},
            {"XDG_CONFIG_HOME", root / "config"},
            {"LANGUAGE", "de"},
            {"LC_ALL", "C.UTF-8"},
            {"XDG_CURRENT_DESKTOP", "KXTest"},
            {"DBUS_SESSION_BUS_ADDRESS", "disabled:"},
        };
        for (const auto& [name, value] : variables)
            setenv(name, value.c_str(), 1);
        fs::create_directories(root / "data/applications");
        fs::create_directories(root / "Dokumente");
        write("config/user-dirs.dirs",
              "XDG_DOCUMENTS_DIR=\"$HOME/Dokumente\"\nXDG_MUSIC_DIR=\"$HOME/gone\"\n");
    }
    ~Computer() { fs::remove_all(root); }

    void write(const fs::path& path, const std::string& text) const {
        fs::create_directories((root / path).parent_path());
        std::ofstream(root / path) << text;
    }
    void install(const std::string& id, const std::string& keys) const {
        const std::string head = "[Desktop Entry]\nType=Application\nExec=/bin/true\nName=" + id + "\n";
        write("data/applications/" + id + ".desktop", head + keys);
    }

    fs::path root;
} const computer;

void runUntil(const std::function<bool()>& condition) {
    while (!condition())
        g_main_context_iteration(nullptr, TRUE);
}

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
    int count = 1;
    char name[] = "test";
    char* arguments[] = {name, nullptr};
    const QGuiApplication application(count, arguments);
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
        HostMachine machine("host", "This");
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

TEST(HostMachine, LaunchesThroughTheDesktopEntryAndSaysWhyNot) {
    HostMachine machine("host", "This");
    const fs::path fifo = computer.root / "fifo";
    ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
    computer.write("script", "#!/bin/sh\necho \"$1 $GIO_LAUNCHED_DESKTOP_FILE\" > " + fifo.string() + "\n");
    fs::permissions(computer.root / "script", fs::perms::owner_all);
    const std::string script = (computer.root / "script").string();
    computer.install("kx-script", "NoDisplay=true\nExec=" + script + " \"two words\" %U\n");
    computer.install("kx-broken", "NoDisplay=true\nExec=/no/such/program\n");
    const auto launch = [&](const std::string& id) {
        std::optional<std::string> result;
        machine.launch({.id = id}, [&](const auto& failure) { result = failure.value_or("started"); });
        runUntil([&] { return result.has_value(); });
        return *result;
    };
    // The library learns of a new entry from a thread that watches the folder.
    std::string outcome;
    do
        outcome = launch("kx-script.desktop");
    while (outcome == "its desktop entry is gone");
    ASSERT_EQ(outcome, "started");
    std::string line;
    std::getline(std::ifstream(fifo), line);
    EXPECT_EQ(line, "two words " + (computer.root / "data/applications/kx-script.desktop").string());
    EXPECT_EQ(launch("kx-gone.desktop"), "its desktop entry is gone");
    EXPECT_NE(launch("kx-broken.desktop"), "started");
    EXPECT_NE(launch("place:kx-unknown://x"), "started");
}

TEST(HostMachine, TellsWhenAnEntryComes) {
    HostMachine machine("host", "This");
    bool isChanged = false;
    const auto watch = machine.watch([&] { isChanged = true; });
    machine.readCatalogue();
    computer.install("kx-new", "NoDisplay=true\n");
    runUntil([&] { return isChanged; });
}

TEST(SpawnedPrograms, StartsAndReaps) {
    SpawnedPrograms programs;
    EXPECT_EQ(programs.reap(programs.start("/bin/false").value()), "exit code 1");
    EXPECT_FALSE(programs.start("/no/such/program"));
}
