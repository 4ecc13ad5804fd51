#include "app/SMThemeView.h"
#include "platform/WindowServer.h"
#include "tests/app/PanelFixtures.h"
#include "tests/support/GuiApplication.h"

#include <QAction>
#include <QComboBox>
#include <QTest>
#include <gtest/gtest.h>

namespace {

/// Shows panels as plain windows and writes down what is asked of it.
struct FakeWindowServer final : platform::WindowServer {
    bool filter = false;
    bool still = false;
    Titles log;

    struct Panel final : platform::PanelWindow {
        FakeWindowServer& server;
        QWidget& view;
        KXRect place{0, 0, 480, 550};
        Panel(FakeWindowServer& owner, QWidget& contentView)
            : server(owner)
            , view(contentView) {}
        KXRect frame() const override { return place; }
        void setFrame(const KXRect& frame) override {
            place = frame;
            view.resize(static_cast<int>(frame.width), static_cast<int>(frame.height));
        }
        bool isVisible() const override { return view.isVisible(); }
        void makeKeyAndOrderFront() override {
            server.log.push_back("front");
            view.show();
        }
        void orderOut() override { view.hide(); }
        void addWindowFilter() override { server.log.push_back("filter"); }
        QImage screenBelow() const override {
            server.log.push_back("capture");
            QImage screen(480, 550, QImage::Format_RGB32);
            screen.fill(Qt::red);
            return screen;
        }
    };

    KXRect visibleFrame(const KXRect&) const override { return {0, 0, 1280, 800}; }
    bool hasWindowFilter() const override { return filter; }
    bool reducesMotion() const override { return still; }
    std::unique_ptr<platform::PanelWindow> makePanel(QWidget& view, platform::PanelDelegate&,
                                                     std::function<KXRect()>) override {
        return std::make_unique<Panel>(*this, view);
    }
};

struct MenuPanel : testing::Test, PanelWorld {
    MenuPanel() {
        ensureGuiApplication();
        owner.contents.topMenu = listTitled({"Documents"});
        owner.contents.pinnedApps = listTitled({"Mail", "Web"});
        owner.contents.searchableApps = listTitled({"Mail", "Web", "Editor"});
        owner.contents.nameList = {"one", "two", "three"};
        owner.contents.allProgramsMenu = SMMenuItem::initWithSubmenu(*listTitled({"Editor"}));
        makeWindow(server);
    }
    void clickAction() {
        const auto* button = widget("actionButton");
        QTest::mouseClick(view, Qt::LeftButton, {}, button->mapTo(view, button->rect().center()));
    }
    FakeWindowServer server;
};

TEST_F(MenuPanel, BlursOnceBelowEveryShowingOrOncePerProcessByTheFilter) {
    window->showMenuWindow();
    window->showMenuWindow();
    EXPECT_EQ(server.log, (Titles{"capture", "front", "front"}))
        << "before the panel is there, and never with it";
    const auto background = [this] { return dynamic_cast<SMThemeView*>(view)->backgroundImage(); };
    EXPECT_GT(background().pixelColor(100, 100).red(), 250);
    window->hideMenuWindow();
    window->showMenuWindow();
    EXPECT_EQ(server.log.size(), 5U) << "a fresh picture for every showing";

    server.filter = true;
    server.log.clear();
    for (int i = 0; i < 2; ++i) {
        window->hideMenuWindow();
        window->showMenuWindow();
    }
    EXPECT_TRUE(background().isNull());
    makeWindow(server);
    window->showMenuWindow();
    EXPECT_EQ(server.log, (Titles{"front", "filter", "front", "front"}));
}

struct PaintCounter final : QObject {
    int paints = 0;
    bool eventFilter(QObject*, QEvent* event) override {
        if (event->type() == QEvent::Paint) ++paints;
        return false;
    }
};

TEST_F(MenuPanel, SlidesInSevenFramesWithoutHandlingEvents) {
    window->showMenuWindow();
    QCoreApplication::processEvents();
    PaintCounter counter;
    box->installEventFilter(&counter);
    bool ran = false;
    const auto begin = loop.clock().now();
    QMetaObject::invokeMethod(
        view, [&] { ran = true; }, Qt::QueuedConnection);
    clickAction();
    EXPECT_EQ(counter.paints, 7);
    EXPECT_FALSE(ran);
    EXPECT_NEAR(std::chrono::duration<double>(loop.clock().now() - begin).count(), 0.1, 0.001);
    const QImage slid = box->grab().toImage();

    clickAction(); // back home
    server.still = true;
    counter.paints = 0;
    clickAction();
    EXPECT_EQ(counter.paints, 0) << "reduced motion";
    QCoreApplication::processEvents();
    EXPECT_EQ(box->grab().toImage(), slid);
}

TEST_F(MenuPanel, PaintsOnlyRowsInViewAndMakesNothingAnewForTheSamePicture) {
    owner.contents.searchableApps =
        listTitled(numbered("A title that is far too long for the width ", 10000));
    window->showMenuWindow();
    QTest::keyClicks(field, "title");
    const QImage before = view->grab().toImage();
    const auto painted = box->paintedRows();
    const auto made = box->tools().madeAnew();
    EXPECT_EQ(view->grab().toImage(), before);
    EXPECT_EQ(box->paintedRows() - painted, visibleTitles(controller().rightMenuCollectionView()).size());
    EXPECT_LT(box->paintedRows() - painted, 30U);
    EXPECT_EQ(box->tools().madeAnew(), made);
}

TEST(SMSearchField, ShowsWhatIsBeingComposedInPlaceOfItsPlaceholder) {
    SMSearchField field;
    QInputMethodEvent composed("c", {});
    QCoreApplication::sendEvent(&field, &composed);
    const QImage bare = field.grab().toImage();
    field.setPlaceholderText("Search");
    EXPECT_EQ(field.grab().toImage(), bare);
    QInputMethodEvent given("", {});
    QCoreApplication::sendEvent(&field, &given);
    EXPECT_NE(field.grab().toImage(), bare);
}

TEST_F(MenuPanel, TellsOfAMachineAndGoesHomeOnlyWhenTheUserChoosesIt) {
    auto* machines = widget<QComboBox>("vmListPopUpButton");
    owner.contents.selectedIndex = 7;
    window->reloadData();
    EXPECT_EQ(machines->currentIndex(), 0) << "out of range changes nothing";
    controller().actionButton()->sendAction();
    machines->setCurrentIndex(2);
    EXPECT_EQ(controller().searchState(), SMMenuStateFolder);
    EXPECT_TRUE(owner.log.empty());
    Q_EMIT machines->activated(2);
    EXPECT_EQ(controller().searchState(), SMMenuStateHome) << "before the main application answers";
    EXPECT_EQ(owner.log, Titles{"select 2"});
}

TEST_F(MenuPanel, TakesKeysThatComeFasterThanItPaintsAndShortcuts) {
    window->showMenuWindow();
    QTest::keyClicks(field, "edi");
    QTest::keyClick(field, Qt::Key_Return, Qt::AltModifier);
    QTest::keyClick(field, Qt::Key_Escape);
    EXPECT_TRUE(field->text().isEmpty());
    QTest::keyClicks(field, "web");
    const std::pair<const char*, const char*> leaves[] = {{"selectAllAction", "web"},
                                                          {"cutAction", ""},
                                                          {"pasteAction", "web"},
                                                          {"pasteAction", "webweb"},
                                                          {"undoAction", "web"}};
    for (const auto& [action, text] : leaves) {
        view->findChild<QAction*>(action)->trigger();
        EXPECT_EQ(field->text(), text) << action;
    }
    for (const auto key : {Qt::Key_Comma, Qt::Key_W}) {
        window->showMenuWindow();
        QApplication::setActiveWindow(view);
        QTest::keyClick(field, key, Qt::ControlModifier);
    }
    EXPECT_EQ(owner.log, (Titles{"action Editor", "close", "settings", "close", "close"}));
}

TEST_F(MenuPanel, MovesToThePaneOnTheSideOfTheKeyWhereItIsMirrored) {
    QGuiApplication::setLayoutDirection(Qt::RightToLeft);
    makeWindow(server);
    window->showMenuWindow();
    const auto press = [this](Qt::Key key) {
        QTest::keyClick(field, key);
        return controller().currentMouseOverMenuButton()->title();
    };
    press(Qt::Key_Down);
    EXPECT_EQ(press(Qt::Key_Right), "Documents") << "which is on the right now";
    EXPECT_EQ(press(Qt::Key_Left), "All Programs");
    QGuiApplication::setLayoutDirection(Qt::LeftToRight);
}

} // namespace
