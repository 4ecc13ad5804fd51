#include "platform/linux/FollowingStatusBar.h"
#include "platform/linux/QtScreenCoordinates.h"
#include "platform/linux/StripStatusBar.h"
#include "tests/support/GuiApplication.h"
#include "tests/support/ManualMainLoop.h"

#include <QTest>
#include <QWidget>
#include <gtest/gtest.h>

namespace {

struct RecordingView final : platform::StatusItemView {
    KXSize frameSize() const override { return {30, 22}; }
    void draw(QPainter&, KXSize size) override { drawn = size; }
    void mouseDown() override { presses += "left "; }
    void rightMouseDown() override { presses += "right "; }
    std::string toolTip() const override { return "tip"; }
    KXSize drawn;
    std::string presses;
};

/// Writes down when an item appears in it (its letter) and goes (the letter with a minus).
struct RecordingBar final : platform::HostedStatusBar {
    struct Item final : platform::StatusItem {
        explicit Item(RecordingBar& itsBar)
            : bar(itsBar) {}
        ~Item() override { record += "-" + bar.letter + " "; }
        void setNeedsDisplay() override { record += "draw " + bar.letter + " "; }
        KXRect frame() const override { return {1, 2, 3, 4}; }
        RecordingBar& bar;
    };
    explicit RecordingBar(std::string itsLetter)
        : letter(std::move(itsLetter)) {}
    std::unique_ptr<platform::StatusItem> addItem(float, platform::StatusItemView&) override {
        record += letter + " ";
        return std::make_unique<Item>(*this);
    }
    using HostedStatusBar::hostAppeared;
    using HostedStatusBar::hostWent;
    inline static std::string record;
    const std::string letter;
};

TEST(FollowingStatusBar, PutsItsItemsWhereThereIsAHostAndMovesThemAfterIt) {
    ManualMainLoop loop;
    RecordingBar tray("T"), notifier("N"), strip("S");
    platform::FollowingStatusBar bar(loop, {&tray, &notifier}, strip);
    RecordingView view;
    auto item = bar.addItem(30, view);
    EXPECT_EQ(item->frame(), KXRect{}) << "nowhere yet";
    item->setNeedsDisplay();
    const auto recorded = [&] {
        loop.advance(std::chrono::seconds(1));
        return std::exchange(RecordingBar::record, "");
    };
    EXPECT_EQ(recorded(), "S ");
    item->setNeedsDisplay();
    EXPECT_EQ(recorded(), "draw S ");
    EXPECT_EQ(item->frame(), (KXRect{1, 2, 3, 4}));
    notifier.hostAppeared();
    EXPECT_EQ(recorded(), "-S N ");
    tray.hostAppeared();
    EXPECT_EQ(recorded(), "-N T ") << "preferred";
    notifier.hostWent();
    EXPECT_EQ(recorded(), "") << "not the one in use";
    tray.hostWent();
    tray.hostAppeared();
    EXPECT_EQ(recorded(), "-T T ") << "another host, though there never seemed to be none";
    tray.hostWent();
    notifier.hostAppeared();
    EXPECT_EQ(recorded(), "-T N ") << "not by way of the strip";
    notifier.hostWent();
    EXPECT_EQ(recorded(), "-N S ");
    item.reset();
    EXPECT_EQ(recorded(), "-S ");
    tray.hostAppeared();
    EXPECT_EQ(recorded(), "");
}

TEST(StripStatusBar, ShowsTheViewAtTheTopRightAndReportsPresses) {
    ensureGuiApplication();
    platform::StripStatusBar bar;
    RecordingView view;
    const auto item = bar.addItem(30, view);
    const QRect screen = QGuiApplication::primaryScreen()->geometry();
    EXPECT_EQ(platform::QtRectFromScreen(item->frame()), QRectF(screen.width() - 30, 0, 30, bar.thickness()));
    EXPECT_EQ(item->frame().maxY(), static_cast<float>(screen.height())) << "y grows upwards";
    QWidget* window = QApplication::topLevelAt(screen.width() - 1, 0);
    ASSERT_TRUE(window && QTest::qWaitForWindowExposed(window));
    EXPECT_EQ(view.drawn, (KXSize{30, 22}));

    QTest::mousePress(window, Qt::LeftButton);
    EXPECT_EQ(view.presses, "left ") << "on the press, not on the release";
    QTest::mousePress(window, Qt::RightButton);
    QTest::mousePress(window, Qt::MiddleButton);
    QTest::mouseDClick(window, Qt::LeftButton);
    EXPECT_EQ(view.presses, "left right left ") << "the second press of a double click counts";
}

} // namespace
