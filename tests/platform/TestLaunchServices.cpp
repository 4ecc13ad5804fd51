#include "lib/kxAppKit/system/KXAppleEvent.h"
#include "lib/kxAppKit/system/KXFileURL.h"
#include "lib/kxAppKit/system/KXWorkspace.h"
#include "platform/linux/ExecLine.h"
#include "platform/linux/LinuxWorkspace.h"
#include "platform/linux/PollMainLoop.h"
#include "platform/linux/ProcProcessTable.h"
#include "platform/linux/SystemClock.h"
#include "tests/support/ScratchComputer.h"

#include <gmock/gmock.h>
#include <sys/stat.h>
#include <thread>

using namespace platform;
using testing::ElementsAre;
using testing::UnorderedElementsAre;

namespace {

struct LaunchServices : testing::Test {
    /// Launches, and answers what the program says of itself: it writes one line into the fifo.
    std::string saidBy(const std::string& path, bool activate, const KXAppleEvent* properties,
                       const std::vector<std::string>& urls = {}) {
        EXPECT_EQ(workspace.launchAppWithPath(path, activate, true, properties, urls, &process), 0);
        std::string line;
        std::getline(std::ifstream(fifo), line);
        return line;
    }

    SystemClock clock;
    PollMainLoop loop{clock};
    ProcProcessTable processes{loop, clock};
    LinuxWorkspace desktop{processes};
    KXWorkspace workspace{desktop.services()};
    platform::LaunchServices& services = desktop.services().launching;
    KXProcess::Pointer process;
    const std::string fifo = computer.root / "said";
};

TEST_F(LaunchServices, StartsExecutablesAndEntriesWithDocumentsAndVariables) {
    ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
    const std::string script = computer.writeProgram("pro gram", "#!/bin/sh\nexec 3>" + fifo + R"sh(
if [ "$GIO_LAUNCHED_DESKTOP_FILE_PID" = $$ ]; then me=me; fi
echo "$*|$GIO_LAUNCHED_DESKTOP_FILE|$KX_LAUNCH_PROPERTIES|${DESKTOP_STARTUP_ID##*_}|$PWD|$me" >&3
exec 3>&-
exec sleep 600
)sh");
    const std::string here = std::filesystem::current_path();
    setenv("KX_LAUNCH_PROPERTIES", "of our own start", 1);
    EXPECT_EQ(saidBy(script, true, nullptr, {"file:///a%20b", "http://c"}), "/a b http://c||||" + here + "|");
    unsetenv("KX_LAUNCH_PROPERTIES");
    ASSERT_NE(process, nullptr);
    EXPECT_TRUE(process->kill());

    const std::string entry = computer.install(
        "kx-say", "Exec=\"" + script + "\" %c:%% %i %U\nIcon=x\nPath=" + computer.root.string() + "\n");
    const KXAppleEvent properties(plist::Dictionary{{"machine", "\u00fcber"}});
    std::string record;
    ASSERT_EQ(properties.copyIntoEventRecord(record), 0);
    EXPECT_EQ(saidBy(entry, false, &properties, {"file:///a%20b", "http://c/d"}),
              "kx-say:% --icon x file:///a%20b http://c/d|" + entry + "|" + record + "|TIME0|" +
                  computer.root.string() + "|me");
    EXPECT_TRUE(process->kill());
    setenv("KX_LAUNCH_PROPERTIES", record.c_str(), 1);
    EXPECT_EQ(KXAppleEvent::ofThisLaunch()->properties(), properties.properties());
    unsetenv("KX_LAUNCH_PROPERTIES");
    const KXAppleEvent large(plist::Dictionary{{"large", std::string(100'000, 'x')}});
    EXPECT_EQ(large.copyIntoEventRecord(record), -50);
}

TEST_F(LaunchServices, OpenTheSettingsOfTheDesktop) {
    const std::string opened = computer.root / "opened";
    ASSERT_EQ(mkfifo(opened.c_str(), 0600), 0);
    computer.writeProgram("bin/lxqt-config-sound", "#!/bin/sh\necho $0 > " + opened + "\n");
    EXPECT_THAT(services.openSettings("sound").value(), testing::HasSubstr("\"KXTest\""));
    setenv("PATH", (computer.root.string() + "/bin:" + getenv("PATH")).c_str(), 1);
    setenv("XDG_CURRENT_DESKTOP", "KXTest:LXQt", 1);
    EXPECT_EQ(services.openSettings("sound"), std::nullopt);
    std::string line;
    std::getline(std::ifstream(opened), line);
    EXPECT_EQ(line, computer.root / "bin/lxqt-config-sound");
    EXPECT_NE(services.openSettings("absent"), std::nullopt);
}

TEST_F(LaunchServices, SayWhyAStartFails) {
    const auto status = [&](const std::string& path, const std::vector<std::string>& urls = {}) {
        return workspace.launchAppWithPath(path, true, true, nullptr, urls, &process);
    };
    EXPECT_EQ(status("/no/such/program"), status::fileNotFound);
    EXPECT_EQ(status(computer.root), status::notAnApplication);
    EXPECT_EQ(status(computer.write("text", "")), status::notAnApplication);
    EXPECT_EQ(status(computer.install("kx-link", "Type=Link\n")), status::notAnApplication);
    EXPECT_EQ(status(computer.writeProgram("bad", "#!/no/such/shell\n")), status::fileNotFound);
    EXPECT_EQ(status("/bin/true", {"--option"}), status::invalidParameter);
    EXPECT_EQ(process, nullptr);
}

TEST_F(LaunchServices, KnowWhoOpensWhat) {
    computer.write("data/mime/globs2", "50:text/x-kx:*.kx\n");
    const auto one =
        computer.install("kx-one", "MimeType=x-scheme-handler/kx;text/x-kx;\nNoDisplay=true\nIcon=one\n");
    computer.install("kx-two", "");
    computer.write("data/applications/mimeinfo.cache",
                   "[MIME Cache]\nx-scheme-handler/kx=kx-one.desktop;kx-two.desktop;gone.desktop;\n"
                   "text/x-kx=kx-one.desktop;\n");
    const auto file = *KXFileURLOfPath(computer.write("some file.kx", "x").native());
    // The library learns of new files from a thread that watches the folders.
    while (services.applications("x-scheme-handler/kx").size() < 2)
        std::this_thread::yield();
    EXPECT_THAT(*KXWorkspace::bundleIdentifiersOfApplicationsForFileOrURL(services, "KX://a"),
                UnorderedElementsAre("kx-one", "kx-two"));
    for (const char* id : {"kx-two", "kx-one"}) {
        EXPECT_EQ(KXWorkspace::setDefaultHandlerForURLScheme(services, "kx", id), 0);
        EXPECT_EQ(KXWorkspace::bundleIdentifierOfDefaultApplicationForURLScheme(services, "KX"), id);
        EXPECT_EQ(KXWorkspace::bundleIdentifierOfAssignedApplicationForFileOrURL(services, "kx:a"), id);
    }
    EXPECT_EQ(KXWorkspace::setDefaultHandlerForURLScheme(services, "kx", "no"), status::applicationNotFound);
    EXPECT_EQ(KXWorkspace::setDefaultHandlerForURLScheme(services, "/", "kx-one"), status::invalidParameter);
    EXPECT_EQ(KXWorkspace::bundleIdentifierOfDefaultApplicationForFileExtension(services, "kx"), "kx-one");
    EXPECT_EQ(KXWorkspace::bundleIdentifierOfAssignedApplicationForFileOrURL(services, file), "kx-one");
    for (const char* nobody : {"", "none", "/"})
        EXPECT_FALSE(KXWorkspace::bundleIdentifierOfDefaultApplicationForFileExtension(services, nobody));
    for (const char* nobody : {"", "kx", "file:///no/such.kx", "none:x"})
        EXPECT_FALSE(KXWorkspace::bundleIdentifiersOfApplicationsForFileOrURL(services, nobody)) << nobody;

    const auto infoAt = [&](const std::string& url) {
        return KXWorkspace::bundleInfoDictionaryOfApplicationAtURL(services, url);
    };
    const auto info = infoAt(*KXFileURLOfPath(one));
    EXPECT_EQ(info["CFBundleIdentifier"].string(), "kx-one");
    EXPECT_TRUE(info["LSUIElement"].boolValue());
    EXPECT_EQ(info["CFBundleURLTypes"].at(0)["CFBundleURLSchemes"].at(0).string(), "kx");
    EXPECT_EQ(info["CFBundleExecutable"].string(), "/bin/true");
    EXPECT_EQ(info["CFBundleIconFile"].string(), "one");
    EXPECT_EQ(infoAt("file:///bin/true")["CFBundleName"].string(), "true");
    EXPECT_FALSE(KXWorkspace::bundleIdentifierOfApplicationAtURL(services, "file:///bin/true"));
    for (const auto& none : {file, std::string("file:///no"), std::string("http://x")})
        EXPECT_TRUE(infoAt(none).isNil());
}

TEST(ExecLine, FillsInWhatTheProgramTakes) {
    const ExecEntry entry{"Na me", "", "/e.desktop"};
    const std::vector<std::string> two = {"file:///a%20b", "http://c"};
    using Commands = std::vector<Command>;
    const auto commands = [&](const Command& exec) { return CommandsOf(exec, entry, two); };
    EXPECT_EQ(commands({"p", "%F"}), Commands({{"p", "/a b", "http://c"}}));
    EXPECT_EQ(commands({"p", "%u"}), Commands({{"p", "file:///a%20b"}, {"p", "http://c"}}));
    EXPECT_EQ(commands({"p", "a=%f", "%i"}), Commands({{"p", "a=/a b"}, {"p", "a=http://c"}}));
    EXPECT_EQ(commands({"p"}), Commands({{"p", "/a b"}, {"p", "http://c"}}));
    EXPECT_THAT(CommandsOf(Command{"p", "%%f", "%u", "%d", "%c%k", "%"}, entry, {}),
                ElementsAre(Command{"p", "%f", "Na me/e.desktop", ""}));
    EXPECT_THAT(InTerminal({"p", "a b"}, [](const char* name) { return *name == 'k'; }),
                ElementsAre("konsole", "-e", "p", "a b"));
    EXPECT_EQ(SettingsCommand("Other:XFCE:KDE", "a b"), Command({"xfce4-settings-manager", "--dialog=a b"}));
    EXPECT_THAT(SettingsCommand("GNOME", ""), ElementsAre("gnome-control-center"));
}

} // namespace
