#include "lib/kxAppKit/KXImage.h"

#include "lib/base/Geometry.h"
#include "lib/base/Log.h"
#include "lib/base/SharedBytes.h"
#include "lib/kxAppKit/KXBitmapImageRep.h"
#include "lib/kxAppKit/KXFileTypeIcons.h"
#include "lib/kxAppKit/KXGeometry.h"
#include "lib/kxAppKit/KXImageRep.h"
#include "lib/plist/Value.h"

#include <QPainter>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <utility>
#include <vector>

namespace {

KXImageRep::Pointer bitmapFromRawIcon(const plist::Value& icon) {
    constexpr auto method = "+[NSImage(KXAppKitAdditions) imageWithRawIcons:]";
    const plist::Value format = icon["format"];
    if (!format.equalsString("bgra")) {
        Log("%s: unknown icon format '%s'\n", method, format.description().c_str());
        return nullptr;
    }
    const std::uint32_t width = icon["width"].unsignedIntValue();
    const std::uint32_t height = icon["height"].unsignedIntValue();
    const SharedBytes data = icon["data"].data();
    // Not in wide numbers, which would look right: a product that wraps passes here, and the bitmap refuses
    // it.
    const std::uint32_t expected = width * height * 4;
    if (data.empty() || data.size() != expected) {
        Log("%s: icon has invalid size %u for width=%u, height=%u\n", method,
            static_cast<unsigned>(data.size()), width, height);
        return nullptr;
    }
    return KXBitmapImageRep::imageRepFromFlippedBGRABuffer(
        reinterpret_cast<const std::uint8_t*>(data.data()), static_cast<std::int32_t>(width),
        static_cast<std::int32_t>(height), static_cast<std::int32_t>(width * 4));
}

} // namespace

KXImage::Pointer KXImage::imageWithRawIcons(const plist::Value& rawIcons) {
    if (!rawIcons.isArray()) return nullptr;
    std::vector<KXImageRep::Pointer> reps;
    for (std::size_t i = 0; i < rawIcons.size(); ++i)
        if (auto bitmap = bitmapFromRawIcon(rawIcons.at(i))) reps.push_back(std::move(bitmap));
    return imageWithRepresentations(reps);
}

KXImage::Pointer KXImage::imageWithRepresentations(const std::vector<KXImageRep::Pointer>& reps) {
    if (reps.empty()) return nullptr;
    auto image = std::make_shared<KXImage>();
    KXSize largest;
    for (const KXImageRep::Pointer& rep : reps) {
        image->addRepresentation(rep);
        if (KXSizeArea(rep->pixelSize()) > KXSizeArea(largest)) largest = rep->pixelSize();
    }
    image->setSize(largest);
    return image;
}

KXImage::Pointer KXImage::warningIcon() {
    return KXFileTypeIcons::iconForFileType(KXFileTypeIcons::fileTypeForHFSTypeCode("caut"));
}

void KXImage::addRepresentation(KXImageRep::Pointer rep) {
    m_representations.push_back(std::move(rep));
    m_squareImage = {};
}

KXImageRep::Pointer KXImage::bestImageRepForSize(KXSize size, bool* isSmaller) const {
    if (KXSizeIsInvalid(size)) return nullptr;
    KXImageRep::Pointer best;
    float bestScale = 0;
    float bestArea = 0;
    for (const KXImageRep::Pointer& rep : m_representations) {
        const KXSize pixels = rep->pixelSize();
        if (pixels == size) {
            best = rep;
            bestScale = 1;
            break;
        }
        const KXRect fitted = KXRectFittingAspect({0, 0, size.width, size.height}, KXSizeAspectRatio(pixels));
        if (KXRectIsInvalid(fitted)) continue;
        const float scale = pixels.width / fitted.width;
        const float area = KXSizeArea(fitted.size());
        const bool smallestOfLarge = scale >= 1 && (bestScale < 1 || bestScale > scale);
        const bool largestOfSmall = scale < 1 && bestScale < 1 && scale > bestScale;
        if (smallestOfLarge || largestOfSmall || (scale == bestScale && area > bestArea)) {
            best = rep;
            bestScale = scale;
            bestArea = area;
        }
    }
    if (isSmaller) *isSmaller = bestScale < 1;
    return best;
}

KXImageRep::Pointer KXImage::imageRepForSize(KXSize size) const {
    const auto areaOf = [](KXSize s) { return s.width * s.height; };
    const float wanted = areaOf(size);
    KXImageRep::Pointer candidate;
    for (const KXImageRep::Pointer& rep : m_representations) {
        const float area = areaOf(rep->size());
        if (area == wanted) return rep;
        // A first one that is too small is never replaced, though a larger one would look right.
        if (!candidate || (area > wanted && area < areaOf(candidate->size()))) candidate = rep;
    }
    return candidate;
}

KXImage::BitmapPointer KXImage::bitmapImageRepForSize(KXSize size) const {
    return std::dynamic_pointer_cast<KXBitmapImageRep>(imageRepForSize(size));
}

KXImage::BitmapPointer KXImage::bitmapImageRep() const {
    for (const KXImageRep::Pointer& rep : m_representations)
        if (auto bitmap = std::dynamic_pointer_cast<KXBitmapImageRep>(rep)) return bitmap;
    return KXBitmapImageRep::imageRepWithData(TIFFRepresentation());
}

KXImage::Pointer KXImage::imageByScalingToSize(KXSize size, bool keepAspectRatio,
                                               KXImageInterpolation interpolation) const {
    constexpr auto method =
        "-[NSImage(KXAppKitAdditions) imageByScalingToSize:keepAspectRatio:interpolation:]";
    const KXSize pixels{std::ceil(size.width), std::ceil(size.height)};
    if (KXSizeIsInvalid(pixels)) {
        Log("%s: Invalid size for image creation: %s\n", method, KXStringFromSize(pixels).c_str());
        return nullptr;
    }
    const KXImageRep::Pointer rep = bestImageRepForSize(pixels);
    if (!rep) {
        Log("%s: Can't find image representation for size %s.\n", method, KXStringFromSize(pixels).c_str());
        return nullptr;
    }
    KXRect target{0, 0, pixels.width, pixels.height};
    if (keepAspectRatio) target = KXRectFittingAspect(target, KXSizeAspectRatio(rep->pixelSize()));
    const auto bitmap = KXBitmapImageRep::imageRepWith32bitBuffer(nullptr, KXPixelCount(pixels.width),
                                                                  KXPixelCount(pixels.height), 0, 0);
    if (!bitmap || !rep->drawIntoBitmapRep(*bitmap, target, interpolation)) return nullptr;
    return imageWithRepresentations({bitmap});
}

QImage KXImage::squareImage(int side) const {
    if (m_squareImage.width() == side) return m_squareImage;
    const auto length = static_cast<float>(side);
    const KXImageRep::Pointer rep = bestImageRepForSize({length, length});
    if (!rep) return {};
    QImage image(side, side, QImage::Format_ARGB32_Premultiplied);
    if (image.isNull()) return image;
    const KXRect fitted = KXRectFittingAspect({0, 0, length, length}, KXSizeAspectRatio(rep->pixelSize()));
    const auto* bitmap = dynamic_cast<const KXBitmapImageRep*>(rep.get());
    if (bitmap && bitmap->pixelSize() == KXSize{length, length}) {
        image = bitmap->premultipliedImage();
    } else {
        image.fill(Qt::transparent);
        QPainter painter(&image);
        painter.setRenderHint(QPainter::SmoothPixmapTransform);
        rep->drawInRect(painter, fitted);
    }
    return m_squareImage = image;
}
