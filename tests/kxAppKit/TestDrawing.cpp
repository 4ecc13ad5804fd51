#include "lib/kxAppKit/KXBezierPath.h"
#include "lib/kxAppKit/KXColor.h"
#include "tests/support/GuiApplication.h"

#include <QImage>
#include <QPainter>
#include <QWindow>
#include <gtest/gtest.h>

namespace {

std::vector<QPointF> pointsOf(const KXBezierPath& path) {
    std::vector<QPointF> points;
    for (int i = 0; i < path.path().elementCount(); ++i)
        points.push_back(path.path().elementAt(i));
    return points;
}

TEST(BezierPath, ArrowsPointAsTheyAreTold) {
    const KXRect rect{0, 0, 7, 4};
    const std::pair<KXArrowDirection, std::vector<QPointF>> arrows[] = {
        {KXArrowDirectionUp, {{0, 0}, {4, 4}, {7, 0}, {0, 0}}},
        {KXArrowDirectionDown, {{0, 4}, {4, 0}, {7, 4}, {0, 4}}},
        {KXArrowDirectionLeft, {{0, 2}, {7, 0}, {7, 4}, {0, 2}}},
        {KXArrowDirectionRight, {{0, 0}, {0, 4}, {7, 2}, {0, 0}}}};
    for (const auto& [direction, points] : arrows)
        EXPECT_EQ(pointsOf(KXBezierPath::arrowInRect(rect, direction)), points) << direction;
    for (const int none : {-1, 4})
        EXPECT_TRUE(KXBezierPath::arrowInRect(rect, none).isEmpty());
    EXPECT_EQ(pointsOf(KXBezierPath::arrowInRect({0.7f, 0, 3, 1}, 0))[1].x(), 2)
        << "the apex itself is rounded";
}

TEST(BezierPath, RoundRectangles) {
    const KXRect rect{10, 20, 30, 12};
    EXPECT_EQ(pointsOf(KXBezierPath::bezierPathWithRoundRect(rect, 0)).front(), QPointF(10, 20));
    const KXBezierPath round = KXBezierPath::bezierPathWithRoundRect(rect, 3);
    EXPECT_EQ(round.bounds(), rect);
    EXPECT_EQ(pointsOf(round)[0], QPointF(10, 23));
    EXPECT_FALSE(round.path().contains(QPointF(10.5, 20.5)));
    EXPECT_TRUE(round.path().contains(QPointF(11, 21)));
    EXPECT_GT(KXBezierPath::bezierPathWithRoundRect(rect, 8).bounds().height, 11)
        << "crosses itself, and is kept";
}

TEST(BezierPath, XSymbolIsTheDiagonalsOfItsSquare) {
    const KXBezierPath path = KXBezierPath::xSymbolInRect({0, 0, 20, 10}, 1);
    const auto points = pointsOf(path);
    ASSERT_EQ(points.size(), 4U);
    EXPECT_FLOAT_EQ(path.lineWidth(), 1.75f);
    EXPECT_EQ(points[3], QPointF(6, 1));
    EXPECT_NEAR(points[0].y(), 8.071, 0.001);
    EXPECT_NEAR(points[1].x(), 13.071, 0.001);
}

TEST(BezierPath, StrokesInside) {
    QImage image(12, 12, QImage::Format_ARGB32_Premultiplied);
    image.fill(Qt::transparent);
    QPainter painter(&image);
    KXBezierPath path = KXBezierPath::bezierPathWithRoundRect({2, 2, 8, 8}, 0);
    path.strokeInside(painter, Qt::black);
    for (int y = 0; y < 12; ++y)
        for (int x = 0; x < 12; ++x) {
            const bool edge = QRect(2, 2, 8, 8).contains(x, y) && !QRect(3, 3, 6, 6).contains(x, y);
            ASSERT_EQ(qAlpha(image.pixel(x, y)), edge ? 255 : 0) << x << ", " << y;
        }
    EXPECT_EQ(path.lineWidth(), 1);
    image.fill(Qt::transparent);
    path.strokeInsideWithinRect(painter, Qt::black, {0, 0, 4, 12});
    EXPECT_EQ(qAlpha(image.pixel(3, 2)), 255);
    EXPECT_EQ(qAlpha(image.pixel(4, 2)), 0);
    EXPECT_FALSE(painter.hasClipping());
}

TEST(BezierPath, GradientsFillTheBandAcrossTheWholeClip) {
    QImage image(40, 64, QImage::Format_ARGB32_Premultiplied);
    image.fill(Qt::transparent);
    QPainter painter(&image);
    KXBezierPath::linearGradientFill(painter, {10, 20, 5, 30}, Qt::black, Qt::white);
    for (int x : {0, 39})
        for (const auto& [y, alpha] : {std::pair{19, 0}, {20, 255}, {49, 255}, {50, 0}})
            EXPECT_EQ(qAlpha(image.pixel(x, y)), alpha) << x << ", " << y;
    EXPECT_LT(qRed(image.pixel(0, 20)), 12);
    EXPECT_GT(qRed(image.pixel(0, 49)), 243);
    image.fill(Qt::transparent);
    painter.setClipRect(8, 0, 4, 64);
    KXBezierPath::linearGradientFill(painter, {0, 0, 1, 64}, QColor(), QColor(255, 0, 0));
    EXPECT_EQ(qAlpha(image.pixel(7, 60)), 0);
    EXPECT_NEAR(qAlpha(image.pixel(9, 32)), 128, 3);
    EXPECT_NEAR(qRed(image.pixel(9, 32)), 64, 4)
        << "half red at half alpha: components fade apart from alpha";
}

TEST(Color, BordersFadeUnlessTheWindowIsActive) {
    ensureGuiApplication();
    QWindow window;
    const auto reds = [&](const QWindow* of) {
        return std::pair(KXColor::darkBorderForView(of).red(), KXColor::semiDarkBorderForView(of).red());
    };
    EXPECT_EQ(reds(nullptr), std::pair(135, 238));
    EXPECT_EQ(reds(&window), std::pair(135, 238));
    window.show();
    window.requestActivate();
    QCoreApplication::processEvents();
    EXPECT_EQ(reds(&window), std::pair(64, 217));
    EXPECT_EQ(KXColor::blackWithAlpha(2), QColor(0, 0, 0));
}

} // namespace
