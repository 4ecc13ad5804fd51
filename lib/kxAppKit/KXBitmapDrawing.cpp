#include "lib/base/Geometry.h"
#include "lib/base/Log.h"
#include "lib/kxAppKit/KXBitmapImageRep.h"
#include "lib/kxAppKit/KXGeometry.h"
#include "lib/kxAppKit/KXImageRep.h"
#include "lib/raster/rasterScale.h"
#include "lib/raster/rasterops.h"

#include <QPainter>
#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <utility>

namespace {

constexpr auto drawMethod = "-[NSImageRep(KXAppKitAdditions) drawIntoBitmapRep:targetRect:interpolation:]";

bool isWhole(KXPoint p) {
    return !KXPointIsInvalid(p) && p.x == std::floor(p.x) && p.y == std::floor(p.y);
}

/// Where a source comes to stand in a target: rows from the top, the offset from the bottom.
struct Placement {
    std::int64_t left;
    std::int64_t top;
    RasterRect common; ///< what both cover, in the target

    Placement(const KXBitmapImageRep& source, const KXBitmapImageRep& target, KXPoint offset) {
        constexpr float farAway = 0x1p40f; // beyond every bitmap, and a sum of two still fits
        left = static_cast<std::int64_t>(std::clamp(offset.x, -farAway, farAway));
        top = std::int64_t{target.pixelsHigh()} - source.pixelsHigh() -
              static_cast<std::int64_t>(std::clamp(offset.y, -farAway, farAway));
        common =
            Raster_Intersection(RasterRect::fromSize(left, top, source.pixelsWide(), source.pixelsHigh()),
                                RasterRect::fromSize(0, 0, target.pixelsWide(), target.pixelsHigh()));
    }
    RasterRect inSource() const {
        return RasterRect::fromSize(common.left - left, common.top - top, common.width(), common.height());
    }
};

RasterLayout layoutOf(const KXBitmapImageRep& bitmap) {
    return {(bitmap.bitmapFormat() & KXAlphaFirstBitmapFormat) != 0,
            (bitmap.bitmapFormat() & KXAlphaNonpremultipliedBitmapFormat) == 0};
}

KXRect wholeOf(const KXBitmapImageRep& bitmap) {
    return {0, 0, bitmap.pixelSize().width, bitmap.pixelSize().height};
}

} // namespace

bool KXBitmapImageRep::copyBitmapDataIntoRep(KXBitmapImageRep& target, KXPoint offset) const {
    if (!isWhole(offset) || target.m_data == m_data || !is32bitNonPlanarRGBWithAlpha() ||
        !target.is32bitNonPlanarRGBWithAlpha()) {
        Log("%s: invalid bitmap copy parameters: offset=%s, source=%s, target=%s\n",
            "-[NSBitmapImageRep(KXAppKitAdditions) copyBitmapDataIntoRep:offset:]",
            KXStringFromPoint(offset).c_str(), description().c_str(), target.description().c_str());
        return false;
    }
    const Placement placed(*this, target, offset);
    if (placed.common.isEmpty()) return true;
    return Raster_CopyBlock({target.m_data, target.m_bytesPerRow}, {m_data, m_bytesPerRow}, 4,
                            placed.inSource(), placed.common.left, placed.common.top);
}

bool KXBitmapImageRep::multiplyPixelDataIntoBitmapRep(KXBitmapImageRep& target, KXPoint offset) const {
    if (!isWhole(offset) || target.m_data == m_data || !is32bitNonPlanarRGBWithAlpha() ||
        !target.is32bitNonPlanarRGBWithAlpha() || !colorProfileMatchesBitmap(target)) {
        Log("%s: invalid parameters: offset=%s, source=%s, target=%s\n",
            "-[NSBitmapImageRep(KXAppKitAdditions) multiplyPixelDataIntoBitmapRep:offset:]",
            KXStringFromPoint(offset).c_str(), description().c_str(), target.description().c_str());
        return false;
    }
    const Placement placed(*this, target, offset);
    if (placed.common.isEmpty()) return true;
    const RasterRect from = placed.inSource();
    const RasterBlock block{target.m_data + placed.common.top * target.m_bytesPerRow + placed.common.left * 4,
                            target.m_bytesPerRow, static_cast<std::size_t>(from.width()),
                            static_cast<std::size_t>(from.height())};
    Raster_Multiply(block, layoutOf(target), m_data + from.top * m_bytesPerRow + from.left * 4, m_bytesPerRow,
                    layoutOf(*this));
    return true;
}

bool KXBitmapImageRep::drawWithBilinearScalingIntoBitmapRep(KXBitmapImageRep& target,
                                                            const KXRect& rect) const {
    constexpr auto method =
        "-[NSBitmapImageRep(KXAppKitAdditions) drawWithBilinearScalingIntoBitmapRep:targetRect:]";
    constexpr int pixelBits = 32;
    constexpr int bilinear = 2;
    const auto complain = [&](const char* format) {
        Log(format, method, KXStringFromRect(rect).c_str(), description().c_str(),
            target.description().c_str());
        return false;
    };
    if (KXRectIsInvalid(rect) || KXSizeIsInvalid(target.pixelSize()) || rect != wholeOf(target) ||
        !is32bitNonPlanarRGBWithAlpha() || !target.is32bitNonPlanarRGBWithAlpha() ||
        !colorProfileMatchesBitmap(target) || m_bitmapFormat != target.m_bitmapFormat ||
        m_bitmapFormat & KXAlphaNonpremultipliedBitmapFormat)
        return complain("%s: invalid bitmap scale parameters: rect=%s, source=%s, target=%s\n");
    const int scaled = Raster_Scale(target.m_data, target.m_bytesPerRow, pixelBits, pixelBits,
                                    target.m_pixelsWide, target.m_pixelsHigh, 1,
                                    RasterRect::fromSize(0, 0, target.m_pixelsWide, target.m_pixelsHigh),
                                    m_data, m_bytesPerRow, pixelBits, pixelBits, 0, m_pixelsWide,
                                    m_pixelsHigh, 1, static_cast<double>(rect.width) / m_pixelsWide,
                                    static_cast<double>(rect.height) / m_pixelsHigh, bilinear);
    return scaled || complain("%s: error scaling bitmap: rect=%s, source=%s, target=%s\n");
}

namespace {

enum class Way { copy, enlarge, platform };

Way wayToDraw(const KXBitmapImageRep* source, const KXBitmapImageRep& target, const KXRect& rect,
              KXImageInterpolation interpolation) {
    if (!source || !source->is32bitNonPlanarRGBWithAlpha() || !source->colorProfileMatchesBitmap(target))
        return Way::platform;
    const KXSize pixels = source->pixelSize();
    if (pixels == rect.size() && rect == KXIntegralRect(rect)) return Way::copy;
    const bool premultiplied = !(source->bitmapFormat() & KXAlphaNonpremultipliedBitmapFormat);
    // One axis is enough: the other may shrink.
    const bool grows = rect.width > pixels.width || rect.height > pixels.height;
    if (interpolation == KXImageInterpolation::high && rect == wholeOf(target) && premultiplied && grows)
        return Way::enlarge;
    return Way::platform;
}

/// Paints on memory that reads as premultiplied R, G, B, A.
bool paint(const KXImageRep& source, QImage image, const KXRect& rect, KXImageInterpolation interpolation) {
    QPainter painter(&image);
    if (!painter.isActive()) return false;
    painter.setCompositionMode(QPainter::CompositionMode_Source);
    painter.setRenderHint(QPainter::SmoothPixmapTransform, interpolation != KXImageInterpolation::none);
    painter.setRenderHint(QPainter::Antialiasing);
    source.drawInRect(painter,
                      {rect.x, static_cast<float>(image.height()) - rect.maxY(), rect.width, rect.height});
    return true;
}

/// The painter knows no layout that begins with alpha, nor rows that stand at odd addresses: those are
/// painted on a copy in the nearest layout that it knows.
bool paintOnBitmap(const KXImageRep& source, KXBitmapImageRep& target, const KXRect& rect,
                   KXImageInterpolation interpolation) {
    if (QImage view = target.imageView(); !view.isNull()) {
        // Painting on a copy of the view would not reach the bitmap.
        return paint(source, std::move(view), rect, interpolation);
    }
    const auto copy = KXBitmapImageRep::imageRepWithPixels(target.pixelsWide(), target.pixelsHigh(), 32);
    const KXBitmapFormat format = target.bitmapFormat();
    return copy && target.copyBitmapDataIntoRep(*copy, {}) && copy->convertBitmapDataFromFormat(format, 0) &&
           paint(source, copy->imageView(), rect, interpolation) &&
           copy->convertBitmapDataFromFormat(0, format) && copy->copyBitmapDataIntoRep(target, {});
}

} // namespace

bool KXImageRep::drawIntoBitmapRep(KXBitmapImageRep& target, const KXRect& rect,
                                   KXImageInterpolation interpolation) const {
    if (!target.is32bitNonPlanarRGBWithAlpha() || KXRectIsInvalid(rect) || KXSizeIsInvalid(pixelSize())) {
        Log("%s: Invalid target for drawing into: rect %s, target %s\n", drawMethod,
            KXStringFromRect(rect).c_str(), target.description().c_str());
        return false;
    }
    const KXRect whole = wholeOf(target);
    const KXRect visible = KXIntegralRect(KXIntersectionRect(rect, whole));
    if (KXRectIsInvalid(visible)) return true;

    const auto* bitmap = dynamic_cast<const KXBitmapImageRep*>(this);
    const Way way = wayToDraw(bitmap, target, rect, interpolation);
    const KXBitmapFormat format = way == Way::platform
                                      ? target.bitmapFormat() & ~KXAlphaNonpremultipliedBitmapFormat
                                      : bitmap->bitmapFormat();
    const auto draw = [&](KXBitmapImageRep& onto, const KXRect& where) {
        if (way == Way::copy) return bitmap->copyBitmapDataIntoRep(onto, where.origin());
        if (way == Way::enlarge) return bitmap->drawWithBilinearScalingIntoBitmapRep(onto, where);
        if (paintOnBitmap(*this, onto, where, interpolation)) return true;
        Log("%s: Could not create graphics context for target: %s\n", drawMethod, onto.description().c_str());
        return false;
    };
    if (format == target.bitmapFormat()) return draw(target, rect);

    const bool overTarget = visible == whole;
    const auto work =
        overTarget
            ? KXBitmapImageRep::imageRepWith32bitBuffer(target.bitmapData(), target.pixelsWide(),
                                                        target.pixelsHigh(), format, target.bytesPerRow())
            : KXBitmapImageRep::imageRepWith32bitBuffer(nullptr, static_cast<std::int32_t>(visible.width),
                                                        static_cast<std::int32_t>(visible.height), format, 0);
    if (!work) return false;
    work->setColorProfileFromBitmap(target);
    const KXRect moved{rect.x - visible.x, rect.y - visible.y, rect.width, rect.height};
    return draw(*work, moved) && work->convertBitmapDataFromFormat(format, target.bitmapFormat()) &&
           (overTarget || work->copyBitmapDataIntoRep(target, visible.origin()));
}
