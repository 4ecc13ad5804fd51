#include "app/menuBackground.h"

#include <QPainter>
#include <cmath>
#include <gtest/gtest.h>
#include <random>
#include <vector>

namespace {

/// The green of the picture blurred by the formula, beyond the edges as it ends there.
std::vector<double> gaussian(const QImage& image, double sigma) {
    const int width = image.width();
    const int height = image.height();
    const int reach = static_cast<int>(std::ceil(5 * sigma));
    std::vector<double> weights;
    double sum = 0;
    for (int i = -reach; i <= reach; ++i)
        sum += weights.emplace_back(std::exp(-i * i / (2 * sigma * sigma)));
    std::vector<double> rows(static_cast<std::size_t>(width) * static_cast<std::size_t>(height));
    auto result = rows;
    const auto at = [&](int x, int y) { return static_cast<std::size_t>(y * width + x); };
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
            for (int i = -reach; i <= reach; ++i)
                rows[at(x, y)] += weights[static_cast<std::size_t>(i + reach)] / sum *
                                  qGreen(image.pixel(std::clamp(x + i, 0, width - 1), y));
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
            for (int i = -reach; i <= reach; ++i)
                result[at(x, y)] += weights[static_cast<std::size_t>(i + reach)] / sum *
                                    rows[at(x, std::clamp(y + i, 0, height - 1))];
    return result;
}

double largestDifference(const QImage& image, const std::vector<double>& expected) {
    double largest = 0;
    for (int y = 0; y < image.height(); ++y)
        for (int x = 0; x < image.width(); ++x)
            largest = std::max(largest, std::abs(qGreen(image.pixel(x, y)) -
                                                 expected[static_cast<std::size_t>(y * image.width() + x)]));
    return largest;
}

/// Windows with hard edges, some of them at the edge of the screen, and noise.
QImage screenWithWindows() {
    QImage image(150, 110, QImage::Format_RGB32);
    std::mt19937 random(7);
    for (int y = 0; y < image.height(); ++y)
        for (int x = 0; x < image.width(); ++x)
            image.setPixel(x, y, qRgb(20, static_cast<int>(random() % 30), 200));
    QPainter painter(&image);
    painter.fillRect(0, 0, 40, 30, Qt::white);
    painter.fillRect(70, 40, 60, 50, QColor(10, 250, 10));
    painter.fillRect(146, 60, 4, 50, Qt::white);
    return image;
}

TEST(MenuBackground, IsAGaussianUpToItsEdges) {
    const QImage screen = screenWithWindows();
    for (const double sigma : {2.5, 4.0, 8.0})
        EXPECT_LT(largestDifference(blurredImage(screen, sigma), gaussian(screen, sigma)), 5) << sigma;

    QImage enlarged(screen.size(), QImage::Format_RGB32);
    QPainter painter(&enlarged);
    painter.setRenderHint(QPainter::SmoothPixmapTransform);
    painter.drawImage(enlarged.rect(), menuBackground(screen));
    EXPECT_LT(largestDifference(enlarged, gaussian(screen, 8)), 10) << "a shift by one pixel makes 12";
}

TEST(MenuBackground, KeepsPlainColoursAndTakesAnySize) {
    QImage plain(31, 1, QImage::Format_ARGB32);
    plain.fill(QColor(255, 0, 128));
    plain.setDevicePixelRatio(2);
    const QImage background = menuBackground(plain);
    EXPECT_EQ(background.width(), 8) << "half the points, not half the pixels";
    for (int x = 0; x < background.width(); ++x)
        EXPECT_EQ(background.pixel(x, 0), qRgb(255, 0, 128));
    EXPECT_TRUE(menuBackground({}).isNull());
    EXPECT_TRUE(menuBackground(plain.copy(0, 0, 1, 1)).isNull());
}

} // namespace
