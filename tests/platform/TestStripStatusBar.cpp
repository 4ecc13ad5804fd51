#include "platform/linux/QtScreenCoordinates.h"
#include "platform/linux/StripStatusBar.h"
#include "tests/support/GuiApplication.h"

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
