#include "app/menuBackground.h"

#include "lib/raster/rasterScale.h"
#include "lib/raster/rasterops.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <vector>

namespace {

/// Half of the 8 points, less what halving the picture and enlarging it again blur by themselves.
constexpr double halfSizeSigma = 3.97;

/// Four floats that are worked on at once.
struct Pixel {
    using Channels = float __attribute__((vector_size(16)));
    Channels channels{};
};

Pixel toPixel(QRgb rgb) {
    return {Pixel::Channels{static_cast<float>(qBlue(rgb)), static_cast<float>(qGreen(rgb)),
                            static_cast<float>(qRed(rgb)), 255}};
}

QRgb toRgb(Pixel::Channels channels) {
    using Levels = int __attribute__((vector_size(16)));
    const auto levels = __builtin_convertvector(channels + 0.5F, Levels);
    return qRgb(levels[2], levels[1], levels[0]);
}

/// A moving average whose outermost pixels count for less than the others, so that it has any variance.
struct Box {
    std::size_t radius; ///< of those that count fully
    float outer;        ///< weight of the one beyond, on either side
    float scale;

    explicit Box(double variance) {
        const double r = std::floor((std::sqrt(12 * variance + 1) - 1) / 2);
        const double full = 2 * r + 1;
        const double weight = full * (variance - r * (r + 1) / 3) / (2 * ((r + 1) * (r + 1) - variance));
        radius = static_cast<std::size_t>(r);
        outer = static_cast<float>(weight);
        scale = static_cast<float>(1 / (full + 2 * weight));
    }
    /// What a line loses at either end.
    std::size_t reach() const { return radius + 1; }

    void average(const std::vector<Pixel>& in, std::vector<Pixel>& out) const {
        out.resize(in.size() - 2 * reach());
        Pixel::Channels sum{};
        for (std::size_t i = 1; i < 2 * reach(); ++i)
            sum += in[i].channels;
        for (std::size_t i = 0; i < out.size(); ++i) {
            const Pixel::Channels after = in[i + 2 * reach()].channels;
            out[i].channels = scale * (sum + outer * (in[i].channels + after));
            sum += after - in[i + 1].channels;
        }
    }
};

constexpr int passes = 3;

/// Blurs the rows and makes columns of them.
QImage blurredAndTransposed(const QImage& image, const Box& box) {
    const auto width = static_cast<std::size_t>(image.width());
    const std::size_t padding = passes * box.reach();
    QImage result(image.height(), image.width(), QImage::Format_RGB32);
    auto* pixels = reinterpret_cast<QRgb*>(result.bits());
    const auto stride = static_cast<std::size_t>(result.bytesPerLine()) / sizeof(QRgb);
    std::vector<Pixel> line;
    std::vector<Pixel> next;
    for (int y = 0; y < image.height(); ++y) {
        const auto* row = reinterpret_cast<const QRgb*>(image.constScanLine(y));
        line.assign(padding, toPixel(row[0]));
        line.reserve(width + 2 * padding);
        std::transform(row, row + width, std::back_inserter(line), toPixel);
        line.resize(width + 2 * padding, toPixel(row[width - 1]));
        for (int pass = 0; pass < passes; ++pass) {
            box.average(line, next);
            line.swap(next);
        }
        for (std::size_t x = 0; x < width; ++x)
            pixels[x * stride + static_cast<std::size_t>(y)] = toRgb(line[x].channels);
    }
    return result;
}

QImage reduced(const QImage& image, QSize size) {
    QImage small(size, QImage::Format_RGB32);
    constexpr int bits = 32;
    const bool scaled =
        Raster_Scale(small.bits(), static_cast<int>(small.bytesPerLine()), bits, bits, size.width(),
                     size.height(), 1, RasterRect::fromSize(0, 0, size.width(), size.height()),
                     image.constBits(), static_cast<int>(image.bytesPerLine()), bits, bits, 0, image.width(),
                     image.height(), 1, static_cast<double>(size.width()) / image.width(),
                     static_cast<double>(size.height()) / image.height(), 1);
    return scaled ? small : QImage();
}

/// What a pixel of an enlarged line lies between.
struct Place {
    int before;
    int after;
    std::uint32_t part; ///< of 256, from the one before
};

Place placeIn(int length, int pixel, int enlargedLength) {
    const double center = (pixel + 0.5) * length / enlargedLength;
    const double place = std::max(0.0, center - 0.5);
    const int before = static_cast<int>(place);
    return {before, std::min(before + 1, length - 1), static_cast<std::uint32_t>((place - before) * 256)};
}

/// Two channels at once.
QRgb between(QRgb before, QRgb after, std::uint32_t part) {
    constexpr QRgb twoChannels = 0x00FF00FF;
    const auto mixed = [part](QRgb a, QRgb b) { return ((a * (256 - part) + b * part) >> 8) & twoChannels; };
    return mixed(before & twoChannels, after & twoChannels) |
           mixed((before >> 8) & twoChannels, (after >> 8) & twoChannels) << 8;
}

/// By two taps each way. In this thread: the toolkit would wake a pool of them, and wait for the slowest. Nor
/// by the scaler, which would take another two of 255 off every colour, and off alpha, and be no faster.
QImage enlarged(const QImage& image, QSize size) {
    QImage result(size, QImage::Format_RGB32);
    std::vector<Place> columns;
    for (int x = 0; x < size.width(); ++x)
        columns.push_back(placeIn(image.width(), x, size.width()));
    std::vector<QRgb> line(static_cast<std::size_t>(image.width()));
    for (int y = 0; y < size.height(); ++y) {
        const Place row = placeIn(image.height(), y, size.height());
        const auto* above = reinterpret_cast<const QRgb*>(image.constScanLine(row.before));
        const auto* below = reinterpret_cast<const QRgb*>(image.constScanLine(row.after));
        for (std::size_t x = 0; x < line.size(); ++x)
            line[x] = between(above[x], below[x], row.part);
        std::ranges::transform(columns, reinterpret_cast<QRgb*>(result.scanLine(y)), [&](const Place& place) {
            return between(line[static_cast<std::size_t>(place.before)],
                           line[static_cast<std::size_t>(place.after)], place.part);
        });
    }
    return result;
}

} // namespace

QImage blurredImage(const QImage& image, double sigma) {
    if (image.isNull()) return {};
    const Box box(sigma * sigma / passes);
    return blurredAndTransposed(blurredAndTransposed(image.convertToFormat(QImage::Format_RGB32), box), box);
}

QImage menuBackground(const QImage& screen) {
    if (screen.width() < 2) return {};
    const QSize half = (screen.deviceIndependentSize() / 2).toSize().expandedTo({1, 1});
    const QImage small = reduced(screen.convertToFormat(QImage::Format_RGB32), half);
    QImage background = enlarged(blurredImage(small, halfSizeSigma), screen.size());
    background.setDevicePixelRatio(screen.devicePixelRatio());
    return background;
}
