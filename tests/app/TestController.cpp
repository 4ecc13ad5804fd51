#include "app/SMController.h"
#include "app/SMMenuItem.h"
#include "lib/base/KXNotificationCenter.h"
#include "lib/ipc/KXIPCClient.h"
#include "lib/kxAppKit/system/KXWorkspace.h"
#include "tests/support/InMemoryDesktop.h"
#include "tests/support/InMemoryNotificationCenter.h"
#include "tests/support/InMemoryPorts.h"
#include "tests/support/InMemoryProcessTable.h"
#include "tests/support/ManualMainLoop.h"

#include <gmock/gmock.h>

using plist::Array;
using plist::Dictionary;
using plist::Value;
using testing::ElementsAre;
using Record = std::vector<std::string>;

namespace {

void resignKey(const void* window) {
    KXNotificationCenter::defaultCenter().postNotification(SMWindowDidResignKeyNotification, window);
}

/// Loses the keyboard when it is ordered out, as windows do.
struct FakeMenuWindow final : SMMenuWindow {
    explicit FakeMenuWindow(Record& itsRecord)
        : record(itsRecord) {
        record.emplace_back("create");
        resignKey(this);
    }
    bool isVisible() const override { return visible; }
    KXRect frame() const override { return current; }
    void setFrame(KXRect frame) override {
        record.emplace_back("setFrame");
        current = frame;
    }
    const void* window() const override { return this; }
    void reloadData() override { record.emplace_back("reloadData"); }
    void updateWindowHeight() override { current.height = 400; }
    void showMenuWindow() override {
        record.emplace_back("show");
        visible = true;
    }
    void hideMenuWindow() override {
        record.emplace_back("hide");
        if (std::exchange(visible, false)) resignKey(this);
    }
    Record& record;
    bool visible = false;
    KXRect current{3, 4, 300, 100};
};

struct FakeStatusBar final : platform::StatusBar {
    struct Item final : platform::StatusItem {
        explicit Item(Record& itsRecord)
            : record(itsRecord) {}
        ~Item() override { record.emplace_back("remove item"); }
        void setNeedsDisplay() override {}
        KXRect frame() const override { return {1000, 878, 24, 22}; }
        Record& record;
    };
    explicit FakeStatusBar(Record& itsRecord)
        : record(itsRecord) {}
    float thickness() const override { return 22; }
    std::unique_ptr<platform::StatusItem> addItem(float length, platform::StatusItemView& view) override {
        record.push_back("add item " + std::to_string(static_cast<int>(length)));
        shown = dynamic_cast<SMStatusItemView*>(&view);
        return std::make_unique<Item>(record);
    }
    Record& record;
    SMStatusItemView* shown = nullptr;
};

/// The real client, writing down what is asked of it. `receive` stands in for the server.
class AgentClient final : public KXIPCClient {
public:
    AgentClient(KXIPCContext& context, Record& record)
        : KXIPCClient(context)
        , m_record(record) {}

    void setAllowIncomingMessages(bool allow) override {
        m_record.emplace_back(allow ? "allow" : "disallow");
        KXIPCClient::setAllowIncomingMessages(allow);
    }
    void removeEntries(const KXIPCObserverEntry::Array& entries, const void* observer) override {
        m_record.push_back("remove " + std::to_string(entries.size()) + " entries");
        KXIPCClient::removeEntries(entries, observer);
    }
    void postMessage(const KXIPCMessage& message, bool synchronously) override {
        m_record.push_back("post " + *message.name() + (synchronously || message.object() ? " oddly" : ""));
        lastUserInfo = message.userInfo();
    }
    void terminateWithDelegate(std::function<void()> selector) override {
        m_record.emplace_back(selector ? "terminate with delegate" : "terminate");
        KXIPCClient::terminateWithDelegate(std::move(selector));
    }
    void receive(const char* name, plist::Value userInfo = {}) {
        KXIPCClient::postMessage(KXIPCMessage(name, {}, std::move(userInfo)), false);
    }
    plist::Value lastUserInfo;

private:
    Record& m_record;
};

class Controller : public testing::Test {
protected:
    Controller() { processes.start(2000, "com.corvane.tesselDaemon"); }
    void launch() {
        controller.applicationWillFinishLaunching();
        controller.applicationDidFinishLaunching();
        mainLoop.advance({});
        record.clear();
    }
    /// What has happened since the last question.
    Record happened() { return std::exchange(record, {}); }

    Record record;
    ManualMainLoop mainLoop;
    InMemoryProcessTable processes;
    InMemoryPortNetwork portNetwork;
    InMemoryPorts ports{portNetwork, mainLoop, {1000, processes.currentProcess()}};
    InMemoryNotificationNetwork noticeNetwork;
    InMemoryNotificationCenter notices{noticeNetwork, mainLoop};
    KXIPCContext context{ports, notices, mainLoop, processes, "com.corvane.tesselStartMenu"};
    InMemoryDesktop desktop;
    KXWorkspace workspace{desktop.services(processes)};
    FakeStatusBar bar{record};
    AgentClient* client = nullptr;
    FakeMenuWindow* window = nullptr;
    std::unique_ptr<platform::Handle> turn;
    SMController controller{{
        .systemStatusBar = bar,
        .sharedWorkspace = workspace,
        .makeClient =
            [this] {
                auto made = std::make_unique<AgentClient>(context, record);
                client = made.get();
                return made;
            },
        .prepareMenuWindow = [this](SMMenuWindowOwner&) { record.emplace_back("prepare"); },
        .makeMenuWindow =
            [this](SMMenuWindowOwner&) {
                auto made = std::make_unique<FakeMenuWindow>(record);
                window = made.get();
                return made;
            },
        .holdTyping = [] { return nullptr; },
        .terminate = [this] { record.emplace_back("end the agent"); },
        .mainLoop = mainLoop,
        .prepareFonts =
            [this](const std::string& text) {
                record.push_back("fonts for " + text);
                turn = mainLoop.startTimer({}, {}, [this] { record.emplace_back("a turn"); });
            },
    }};
};

TEST_F(Controller, StartsAndEndsInOrder) {
    EXPECT_EQ(SMController::sharedController(), &controller);
    controller.applicationWillFinishLaunching();
    controller.applicationDidFinishLaunching();
    EXPECT_THAT(happened(), ElementsAre("allow", "add item 30"));
    mainLoop.advance({});
    EXPECT_THAT(happened(), ElementsAre("prepare")) << "not while starting, nor in a click";
    controller.onStatusItemClicked();
    record.clear();
    controller.applicationWillTerminate();
    EXPECT_THAT(happened(), ElementsAre("remove 4 entries", "remove item", "terminate", "disallow"));
    resignKey(window);
    controller.applicationWillTerminate();
    EXPECT_THAT(happened(), ElementsAre()) << "observes nothing any more, and once is enough";
}

TEST_F(Controller, OpensUnderTheItemAndClosesOnTheNextClick) {
    launch();
    processes.walks = 0;
    bar.shown->mouseDown();
    EXPECT_EQ(processes.walks, 1) << "a click must stay cheap";
    EXPECT_THAT(happened(), ElementsAre("create", "setFrame", "show", "post menu.refresh"));
    EXPECT_EQ(window->frame(), (KXRect{725, 478, 300, 400}));
    EXPECT_TRUE(bar.shown->isSelected());
    bar.shown->rightMouseDown();
    EXPECT_THAT(happened(), ElementsAre("hide", "hide")) << "losing the keyboard closes once more";
    EXPECT_FALSE(bar.shown->isSelected());
    bar.shown->mouseDown();
    EXPECT_THAT(happened(), ElementsAre("reloadData", "setFrame", "show", "post menu.refresh"));
}

TEST_F(Controller, ObeysTheMainApplication) {
    launch();
    client->receive("menu.hide");
    client->receive("KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION");
    EXPECT_THAT(happened(), ElementsAre());
    client->receive("menu.show");
    EXPECT_THAT(happened(), ElementsAre("create", "setFrame", "show", "post menu.refresh"));
    client->receive("KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION");
    EXPECT_THAT(happened(), ElementsAre("post menu.refresh"));
    client->receive("menu.show");
    EXPECT_THAT(happened(), ElementsAre("hide", "hide")) << "a toggle";
    client->receive("KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION");
    client->receive("menu.hide");
    EXPECT_THAT(happened(), ElementsAre("hide")) << "stamps the time of hiding again";
}

TEST_F(Controller, ClosesWhenTheMenuLosesTheKeyboardAndForNoOtherWindow) {
    launch();
    resignKey(nullptr);
    controller.onStatusItemClicked();
    resignKey(&record);
    EXPECT_TRUE(window->visible);
    resignKey(window);
    EXPECT_FALSE(window->visible);
    controller.onStatusItemClicked();
    controller.applicationDidResignActive();
    EXPECT_FALSE(window->visible || bar.shown->isSelected());
}

TEST_F(Controller, EndsTheAgentWhenNoMainApplicationRuns) {
    launch();
    const auto other = processes.start(3000, "com.corvane.tessel");
    processes.terminate(*processes.serialNumberOf(2000));
    controller.onStatusItemClicked();
    controller.closeMenuWindow();
    EXPECT_THAT(happened(), testing::Not(testing::Contains("end the agent")));
    processes.terminate(other);
    controller.onStatusItemClicked();
    EXPECT_THAT(happened(),
                ElementsAre("end the agent", "reloadData", "setFrame", "show", "post menu.refresh"));
}

TEST_F(Controller, ReplacesItsModelWithEveryUpdate) {
    launch();
    const auto list = [](const char* title) -> Value { return Array{Dictionary{{"title", title}}}; };
    const Value menu = Dictionary{{"topMenu", list("top")},        {"bottomMenu", list("bottom")},
                                  {"pinnedApps", list("pinned")},  {"frequentlyUsedApps", list("frequent")},
                                  {"searchableApps", list("all")}, {"allPrograms", Array{1, Dictionary{}}}};
    client->receive("menu.update",
                    Dictionary{{"menu", menu}, {"nameList", Array{"one", 2, "three"}}, {"selectedIndex", 2}});
    EXPECT_THAT(happened(), ElementsAre()) << "nobody shows it yet";
    const SMMenuModel& model = controller.model();
    EXPECT_EQ(model.topMenu->at(0)->title(), "top");
    EXPECT_EQ(model.bottomMenu->at(0)->title(), "bottom");
    EXPECT_EQ(model.pinnedApps->at(0)->title(), "pinned");
    EXPECT_EQ(model.frequentlyUsedApps->at(0)->title(), "frequent");
    EXPECT_EQ(model.searchableApps->at(0)->title(), "all");
    EXPECT_EQ(model.allProgramsMenu->submenu()->size(), 2u);
    EXPECT_THAT(model.nameList, ElementsAre("one", "", "three")) << "a bad name must not move the others";
    EXPECT_EQ(model.selectedIndex, 2);

    controller.onStatusItemClicked();
    record.clear();
    client->receive("menu.update",
                    Dictionary{{"menu", Dictionary{{"topMenu", "junk"}, {"allPrograms", Array{}}}},
                               {"nameList", Dictionary{{"a", "b"}}}});
    EXPECT_THAT(happened(), ElementsAre("reloadData"));
    EXPECT_FALSE(model.topMenu || model.pinnedApps);
    EXPECT_TRUE(model.nameList.empty());
    EXPECT_EQ(model.selectedIndex, 0);
    EXPECT_TRUE(model.allProgramsMenu->submenu()->empty()) << "an empty tree is a tree";
    client->receive("menu.update");
    EXPECT_EQ(model.allProgramsMenu, nullptr);
}

TEST_F(Controller, PreparesFontsOfNewScriptsOneInATurnWhileTheMenuIsHidden) {
    launch();
    const auto update = [this](const char* title) {
        const Value deep = Dictionary{{"submenuInfoArray", Array{Dictionary{{"title", title}}}}};
        client->receive("menu.update", Dictionary{{"menu", Dictionary{{"allPrograms", Array{deep}}}}});
        mainLoop.runPending();
        return happened();
    };
    EXPECT_THAT(update("Mail 日本 mail, café 😀"),
                ElementsAre("fonts for Mail 日本 ", "a turn", "fonts for 日本 mail,", "a turn", "fonts for 😀",
                            "a turn"));
    EXPECT_THAT(update("日 Post 😁"), ElementsAre()) << "known";
    controller.onStatusItemClicked();
    record.clear();
    EXPECT_THAT(update("почта"), ElementsAre("reloadData"));
    controller.closeMenuWindow();
    mainLoop.runPending();
    EXPECT_THAT(happened(), ElementsAre("hide", "hide", "fonts for почта", "a turn"));
}

TEST_F(Controller, PassesTheUsersChoicesOn) {
    launch();
    controller.performMenuItemAction(*SMMenuItem::initWithDictionary(Dictionary{{"title", "only a title"}}));
    EXPECT_EQ(client->lastUserInfo, Value(Dictionary{{"representedObject", ""}}));
    controller.selectIndex(2);
    EXPECT_EQ(client->lastUserInfo, Value(Dictionary{{"selectedIndex", 2}}));
    controller.showMenuSettings();
    EXPECT_TRUE(client->lastUserInfo.isNil());
    EXPECT_THAT(happened(), ElementsAre("post menu.onAction", "post menu.selectIndex", "post menu.settings"));
}

} // namespace
