#include "app/SMMenuWindowForm.h"
#include "app/SMSearchField.h"
#include "app/SMThemeView.h"
#include "app/menuPainter.h"
#include "platform/UserDefaults.h"
#include "platform/linux/QtWindowServer.h"
#include "tests/app/MenuFixtures.h"
#include "tests/support/GuiApplication.h"

#include <QAction>
#include <QComboBox>
#include <QPainter>
#include <QTest>
#include <gtest/gtest.h>

namespace {

struct FakeDefaults final : platform::UserDefaults {
    int variant = 0;
    int integerForKey(const std::string& key) const override {
        return key == "AppleAquaColorVariant" ? variant : 0;
    }
};

QWidget* newestPanel() {
    QWidget* panel = nullptr;
    for (QWidget* widget : QApplication::topLevelWidgets())
        if (widget->objectName() == "menuWindow" && !widget->property("isKnown").toBool()) panel = widget;
    panel->setProperty("isKnown", true);
    return panel;
}

/// The real window and controller, on a display that shows nothing.
struct MenuWindow : testing::Test {
    MenuWindow() {
        ensureGuiApplication();
        owner.contents.topMenu = listTitled({"Documents"});
        owner.contents.pinnedApps = listTitled({"Mail", "Web"});
        owner.contents.searchableApps = listTitled({"Mail", "Web", "Editor"});
        owner.contents.nameList = {"one", "two", "three"};
        window = SMMakeMenuWindow(owner, {server, loop.clock(), loop, keys, defaults});
        owner.window = window.get();
        view = newestPanel();
        field = view->findChild<SMSearchField*>("searchField");
        window->showMenuWindow();
    }
    QColor pixel(int x, int y) { return view->grab().toImage().pixelColor(x, y); }

    platform::QtWindowServer server;
    FakeKeys keys;
    FakeDefaults defaults;
    ManualMainLoop loop;
    FakeOwner owner;
    std::unique_ptr<SMMenuWindow> window;
    QWidget* view = nullptr;
    SMSearchField* field = nullptr;
};

TEST_F(MenuWindow, TakesKeysThatComeFasterThanItPaints) {
    QTest::keyClicks(field, "edi");
    QTest::keyClick(field, Qt::Key_Return, Qt::AltModifier);
    EXPECT_EQ(owner.log, (std::vector<std::string>{"action Editor", "close"}));
    QTest::keyClick(field, Qt::Key_Escape);
    EXPECT_TRUE(field->text().isEmpty());
}

TEST_F(MenuWindow, TellsOfAMachineOnlyWhenTheUserChoosesIt) {
    auto* machines = view->findChild<QComboBox*>("vmListPopUpButton");
    owner.contents.selectedIndex = 7;
    window->reloadData();
    EXPECT_EQ(machines->currentIndex(), 0) << "out of range changes nothing";
    EXPECT_TRUE(owner.log.empty());
    machines->setCurrentIndex(2);
    Q_EMIT machines->activated(2);
    EXPECT_EQ(owner.log, std::vector<std::string>{"select 2"});
}

TEST_F(MenuWindow, PaintsPanesHighlightAndPalette) {
    EXPECT_EQ(pixel(300, 500), QColor(Qt::white));
    const QColor blue = pixel(4, 20);
    EXPECT_GT(blue.blue(), 200);
    EXPECT_NE(pixel(60, 300), QColor(Qt::white)) << "the wash";
    defaults.variant = 6;
    EXPECT_LT(pixel(4, 20).blue(), 130);

    QTest::mouseMove(view, QPoint(440, 110));
    QTest::mouseMove(view, QPoint(440, 112));
    EXPECT_NE(pixel(440, 110), QColor(Qt::white)) << "the row under the mouse";
}

TEST_F(MenuWindow, HasAMenuOfKeyboardShortcuts) {
    const auto action = [this](const char* name) { return view->findChild<QAction*>(name); };
    QTest::keyClicks(field, "web");
    action("selectAllAction")->trigger();
    action("cutAction")->trigger();
    EXPECT_TRUE(field->text().isEmpty());
    action("pasteAction")->trigger();
    action("pasteAction")->trigger();
    EXPECT_EQ(field->text(), "webweb");
    action("undoAction")->trigger();
    EXPECT_EQ(field->text(), "web");
    QApplication::setActiveWindow(view);
    QTest::keyClick(field, Qt::Key_Comma, Qt::ControlModifier);
    window->showMenuWindow();
    QApplication::setActiveWindow(view);
    QTest::keyClick(field, Qt::Key_W, Qt::ControlModifier);
    EXPECT_EQ(owner.log, (std::vector<std::string>{"settings", "close", "close"}));
}

struct Mirroring {
    Mirroring() {
        ensureGuiApplication();
        QGuiApplication::setLayoutDirection(Qt::RightToLeft);
    }
    ~Mirroring() { QGuiApplication::setLayoutDirection(Qt::LeftToRight); }
};
struct MirroredMenuWindow : Mirroring, MenuWindow {};

TEST_F(MirroredMenuWindow, PutsEveryPartWhereItsMirrorImageLies) {
    const auto places = [](const QWidget& panel) {
        std::map<QString, QRect> found;
        for (const char* name : {"topPaneBox", "leftPaneBox", "rightPaneBox", "leftMenuCollectionView",
                                 "rightMenuBox", "settingsButton", "actionButton", "searchField"}) {
            const auto* part = panel.findChild<QWidget*>(name);
            found[name] = {part->mapTo(&panel, QPoint()), part->size()};
        }
        return found;
    };
    const auto mirrored = places(*view);
    QGuiApplication::setLayoutDirection(Qt::LeftToRight);
    const auto plain =
        SMLoadMenuWindow({server, loop.clock(), loop, keys, defaults}, [] { return KXRect(); });
    plain->setFrame(window->frame());
    for (const auto& [name, place] : places(*newestPanel()))
        EXPECT_EQ(mirrored.at(name), QRect(QPoint(480 - place.x() - place.width(), place.y()), place.size()))
            << name.toStdString();
}

TEST_F(MirroredMenuWindow, MovesToThePaneOnTheSideOfTheKey) {
    const auto highlighted = [this] {
        return dynamic_cast<SMMenuWindowController&>(*window).currentMouseOverMenuButton()->title();
    };
    QTest::keyClick(field, Qt::Key_Down);
    QTest::keyClick(field, Qt::Key_Right);
    EXPECT_EQ(highlighted(), "Documents") << "which is on the right now";
    QTest::keyClick(field, Qt::Key_Left);
    EXPECT_EQ(highlighted(), "All Programs");
}

TEST(ThemeView, OutlinesSquareCornersAboveAndRoundOnesBelow) {
    const auto path = SMThemeView::windowPath({0, 0, 100, 60}).path();
    EXPECT_EQ(path.boundingRect(), QRectF(0, 0, 100, 60));
    EXPECT_TRUE(path.contains(QPointF(0.5, 59.5)));
    EXPECT_TRUE(path.contains(QPointF(99.5, 59.5)));
    EXPECT_FALSE(path.contains(QPointF(0.5, 0.5)));
    EXPECT_FALSE(path.contains(QPointF(99.5, 0.5)));
    EXPECT_EQ(SMThemeView::windowPath({0, 0, 100, 10}).path().boundingRect(), QRectF(0, 0, 100, 10));
}

TEST(MenuPainter, ShortensWhatIsTooLongAndKeepsHairlinesWhole) {
    ensureGuiApplication();
    const FakeDefaults defaults;
    MenuPainter tools(defaults);
    const float full = tools.textSize("A rather long title").width;
    QImage image(400, 20, QImage::Format_ARGB32_Premultiplied);
    image.fill(Qt::white);
    QPainter painter(&image);
    tools.drawText(painter, "A rather long title", {0, 0, full / 2, 15}, 0);
    tools.drawText(painter, "unseen", {300, 0, -5, 15}, 0);
    QImage blank(400 - static_cast<int>(full / 2) - 1, 20, image.format());
    blank.fill(Qt::white);
    EXPECT_EQ(image.copy(400 - blank.width(), 0, blank.width(), 20), blank);
    EXPECT_NE(image.copy(0, 0, blank.width(), 20), blank);

    for (const double scale : {1.0, 1.25, 1.5, 2.0, 3.0}) {
        painter.setTransform(QTransform::fromScale(scale, scale));
        for (float y = 0; y < 10; ++y) {
            const QRectF device = painter.deviceTransform().mapRect(MenuHairline(painter, {0, y, 10, 1}));
            EXPECT_NEAR(device.height(), std::floor(scale), 1e-6);
            EXPECT_NEAR(device.y(), std::round(device.y()), 1e-6);
        }
    }
}

} // namespace
