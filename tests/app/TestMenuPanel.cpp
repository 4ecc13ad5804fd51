#include "app/SMMenuListWidget.h"
#include "app/SMMenuWindowForm.h"
#include "app/SMThemeView.h"
#include "platform/UserDefaults.h"
#include "platform/WindowServer.h"
#include "tests/app/MenuFixtures.h"
#include "tests/support/GuiApplication.h"

#include <QApplication>
#include <QTest>
#include <gtest/gtest.h>

namespace {

struct NoDefaults final : platform::UserDefaults {
    int integerForKey(const std::string&) const override { return 0; }
};

/// Shows panels as plain windows and writes down what is asked of it.
struct FakeWindowServer final : platform::WindowServer {
    bool filter = false;
    bool still = false;
    std::vector<std::string> log;

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

    KXRect visibleFrame() const override { return {0, 0, 1280, 800}; }
    bool hasWindowFilter() const override { return filter; }
    bool reducesMotion() const override { return still; }
    std::unique_ptr<platform::PanelWindow> makePanel(QWidget& view, platform::PanelDelegate&,
                                                     std::function<KXRect()>) override {
        return std::make_unique<Panel>(*this, view);
    }
};

struct MenuPanel : testing::Test {
    MenuPanel() {
        ensureGuiApplication();
        owner.contents.pinnedApps = listTitled({"Mail", "Web"});
        const auto programs =
            plist::Dictionary{{"title", "All"}, {"submenuInfoArray", plist::Array{leafInfo("Editor")}}};
        owner.contents.allProgramsMenu = SMMenuItem::initWithDictionary(programs);
    }
    std::unique_ptr<SMMenuWindow> makeWindow() {
        auto made = SMMakeMenuWindow(owner, {server, loop.clock(), loop, keys, defaults});
        for (QWidget* widget : QApplication::topLevelWidgets())
            if (widget->objectName() == "menuWindow") view = static_cast<SMThemeView*>(widget);
        box = view->findChild<SMMenuListWidget*>("rightMenuBox");
        return made;
    }
    void clickAction() {
        const auto* button = view->findChild<QWidget*>("actionButton");
        QTest::mouseClick(view, Qt::LeftButton, {}, button->mapTo(view, button->rect().center()));
    }

    FakeWindowServer server;
    FakeKeys keys;
    NoDefaults defaults;
    ManualMainLoop loop;
    FakeOwner owner;
    SMThemeView* view = nullptr;
    SMMenuListWidget* box = nullptr;
};

TEST_F(MenuPanel, BlursOnceBelowEveryShowingOrOncePerProcessByTheFilter) {
    using Log = std::vector<std::string>;
    auto window = makeWindow();
    window->showMenuWindow();
    window->showMenuWindow();
    EXPECT_EQ(server.log, (Log{"capture", "front", "front"}))
        << "before the panel is there, and never with it";
    EXPECT_EQ(view->backgroundImage().pixelColor(100, 100), QColor(Qt::red));
    window->hideMenuWindow();
    window->showMenuWindow();
    EXPECT_EQ(server.log.size(), 5U) << "a fresh picture for every showing";

    server.filter = true;
    server.log.clear();
    for (int i = 0; i < 2; ++i) {
        window->hideMenuWindow();
        window->showMenuWindow();
    }
    EXPECT_TRUE(view->backgroundImage().isNull());
    window = makeWindow();
    window->showMenuWindow();
    EXPECT_EQ(server.log, (Log{"front", "filter", "front", "front"}));
}

struct PaintCounter final : QObject {
    int paints = 0;
    bool eventFilter(QObject*, QEvent* event) override {
        if (event->type() == QEvent::Paint) ++paints;
        return false;
    }
};

TEST_F(MenuPanel, SlidesInSevenFramesWithoutHandlingEvents) {
    const auto window = makeWindow();
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

} // namespace
