#include "app/menuBackground.h"

#include <QPainter>
#include <cmath>
#include <gtest/gtest.h>
#include <random>

namespace {

/// The green there of the picture blurred by the formula, beyond the edges as it ends there.
double gaussian(const QImage& image, double sigma, int x, int y) {
    const int reach = static_cast<int>(4 * sigma);
    double sum = 0;
    double weights = 0;
    for (int dy = -reach; dy <= reach; ++dy)
        for (int dx = -reach; dx <= reach; ++dx) {
            const double weight = std::exp(-(dx * dx + dy * dy) / (2 * sigma * sigma));
            const int fromX = std::clamp(x + dx, 0, image.width() - 1);
            const int fromY = std::clamp(y + dy, 0, image.height() - 1);
            sum += weight * qGreen(image.pixel(fromX, fromY));
            weights += weight;
        }
    return sum / weights;
}

double largestDifference(const QImage& blurred, const QImage& image, double sigma) {
    double largest = 0;
    for (int y = 0; y < image.height(); y += 9)
        for (int x = 0; x < image.width(); x += 7)
            largest = std::max(largest, std::abs(qGreen(blurred.pixel(x, y)) - gaussian(image, sigma, x, y)));
    return largest;
}

TEST(MenuBackground, IsAGaussianUpToItsEdges) {
    // Windows with hard edges, some of them at the edge of the screen, and noise.
    QImage screen(150, 110, QImage::Format_RGB32);
    std::mt19937 random(7);
    for (int i = 0; i < 150 * 110; ++i)
        screen.setPixel(i % 150, i / 150, qRgb(20, static_cast<int>(random() % 30), 200));
    QPainter windows(&screen);
    windows.fillRect(0, 0, 40, 30, Qt::white);
    windows.fillRect(70, 40, 60, 50, QColor(10, 250, 10));
    windows.fillRect(146, 60, 4, 50, Qt::white);
    windows.end();
    for (const double sigma : {2.5, 8.0})
        EXPECT_LT(largestDifference(blurredImage(screen, sigma), screen, sigma), 5) << sigma;

    EXPECT_LT(largestDifference(menuBackground(screen), screen, 8), 10) << "a shift by one pixel makes 12";
}

TEST(MenuBackground, KeepsPlainColoursAndTakesAnySize) {
    QImage plain(31, 1, QImage::Format_ARGB32);
    plain.fill(QColor(0, 200, 0));
    plain.setDevicePixelRatio(2);
    const QImage background = menuBackground(plain);
    EXPECT_EQ(background.size(), plain.size());
    EXPECT_EQ(background.devicePixelRatio(), 2);
    for (int x = 0; x < 31; ++x)
        EXPECT_NEAR(qGreen(background.pixel(x, 0)), 200, 2) << "reducing rounds down";
    EXPECT_TRUE(menuBackground({}).isNull());
    EXPECT_TRUE(menuBackground(plain.copy(0, 0, 1, 1)).isNull());
}

} // namespace
