#include "lib/base/Geometry.h"
#include "lib/kxAppKit/KXBitmapImageRep.h"
#include "lib/kxAppKit/KXFileTypeIcons.h"
#include "lib/kxAppKit/KXGeometry.h"
#include "lib/kxAppKit/KXImage.h"
#include "lib/kxAppKit/KXImageRep.h"
#include "lib/kxAppKit/KXQtGeometry.h"

#include <QPainter>
#include <cmath>
#include <memory>
#include <string>

namespace {

KXRect wholeOf(KXSize size) {
    return {0, 0, size.width, size.height};
}

QPainter::CompositionMode modeOf(KXCompositingOperation operation) {
    switch (operation) {
    case KXCompositingOperation::copy:
        return QPainter::CompositionMode_Source;
    case KXCompositingOperation::sourceOver:
        return QPainter::CompositionMode_SourceOver;
    case KXCompositingOperation::sourceAtop:
        return QPainter::CompositionMode_SourceAtop;
    }
    return QPainter::CompositionMode_SourceOver;
}

/// A new image of `size` with one bitmap, on which `draw` paints (y down).
template <typename Drawing>
KXImage::Pointer imageDrawnBy(KXSize size, KXImageInterpolation interpolation, Drawing&& draw) {
    const auto bitmap = KXBitmapImageRep::imageRepWith32bitBuffer(
        nullptr, KXPixelCount(std::ceil(size.width)), KXPixelCount(std::ceil(size.height)), 0, 0);
    if (!bitmap) return nullptr;
    QImage pixels = bitmap->imageView();
    QPainter painter(&pixels);
    painter.setRenderHint(QPainter::SmoothPixmapTransform, interpolation != KXImageInterpolation::none);
    draw(painter);
    painter.end();
    bitmap->setSize(size);
    auto image = std::make_shared<KXImage>(size);
    image->addRepresentation(bitmap);
    return image;
}

} // namespace

KXImage::Pointer KXImage::imageWithCIImage(const KXExtentImage* image) {
    if (!image) return nullptr;
    const KXSize size{static_cast<float>(image->image.width()), static_cast<float>(image->image.height())};
    return imageDrawnBy(size, KXImageInterpolation::standard, [&](QPainter& painter) {
        painter.setCompositionMode(QPainter::CompositionMode_Source);
        // Not at the corner, which would look right: the picture keeps the place that its extent says.
        painter.drawImage(KXQtPoint({image->origin.x, -image->origin.y}), image->image);
    });
}

KXImage::Pointer KXImage::initWithImage(const KXImage& image, KXSize size,
                                        KXImageInterpolation interpolation) {
    if (size == KXSize{}) return std::make_shared<KXImage>(image);
    if (!image.isValid()) return nullptr;
    return imageDrawnBy(size, interpolation, [&](QPainter& painter) {
        image.drawInRect(painter, wholeOf(size), {}, KXCompositingOperation::copy, 1);
    });
}

KXImage::Pointer KXImage::representationForSize(KXSize size) const {
    return imageDrawnBy(size, KXImageInterpolation::high, [&](QPainter& painter) {
        if (const KXImageRep::Pointer rep = imageRepForSize(size)) rep->drawInRect(painter, wholeOf(size));
    });
}

KXRect KXImage::scaledRectForFrame(const KXRect& frame) const {
    return KXIntegralRect(KXRectFittingAspect(frame, KXSizeAspectRatio(m_size)));
}

void KXImage::maintainAspectRatioAndDrawInRect(QPainter& painter, const KXRect& rect) const {
    const bool smooth = painter.testRenderHint(QPainter::SmoothPixmapTransform);
    painter.setRenderHint(QPainter::SmoothPixmapTransform);
    drawInRect(painter, scaledRectForFrame(rect), {}, KXCompositingOperation::sourceOver, 1);
    painter.setRenderHint(QPainter::SmoothPixmapTransform, smooth);
}

KXImage::Pointer KXImage::maintainAspectRatioAndScaleToSize(KXSize size) const {
    const KXSize kept = scaledRectForFrame(wholeOf(size)).size();
    return imageDrawnBy(kept, KXImageInterpolation::high, [&](QPainter& painter) {
        drawInRect(painter, wholeOf(kept), {}, KXCompositingOperation::sourceOver, 1);
    });
}

KXImage::Pointer KXImage::selectedImage() const {
    return imageDrawnBy(m_size, KXImageInterpolation::standard, [&](QPainter& painter) {
        drawInRect(painter, wholeOf(m_size), {}, KXCompositingOperation::copy, 1);
        painter.setCompositionMode(modeOf(KXCompositingOperation::sourceAtop));
        painter.fillRect(KXQtRect(wholeOf(m_size)), QColor::fromRgbF(0, 0, 0, 0.35f));
    });
}

KXImage::Pointer KXImage::addBadgeWithType(const std::string& type) const {
    const Pointer badge = KXFileTypeIcons::iconForFileType(KXFileTypeIcons::fileTypeForHFSTypeCode(type));
    return imageByApplyingOverlay(badge ? *badge : KXImage());
}

KXImage::Pointer KXImage::imageByApplyingOverlay(const KXImage& overlay) const {
    return imageDrawnBy(m_size, KXImageInterpolation::high, [&](QPainter& painter) {
        drawInRect(painter, wholeOf(m_size), {}, KXCompositingOperation::copy, 1);
        overlay.drawInRect(painter, wholeOf(m_size), {}, KXCompositingOperation::sourceOver, 1);
    });
}

void KXImage::drawInRect(QPainter& painter, const KXRect& rect, const KXRect& fromRect,
                         KXCompositingOperation operation, float fraction) const {
    const QSizeF device = painter.deviceTransform().mapRect(KXQtRect(rect)).size();
    const KXImageRep::Pointer rep =
        bestImageRepForSize({static_cast<float>(device.width()), static_cast<float>(device.height())});
    if (!rep) return;
    painter.save();
    painter.setCompositionMode(modeOf(operation));
    painter.setOpacity(painter.opacity() * static_cast<qreal>(fraction));
    KXRect whole = rect;
    if (fromRect != KXRect{} && fromRect != wholeOf(m_size)) {
        const float scaleX = rect.width / fromRect.width;
        const float scaleY = rect.height / fromRect.height;
        const float top = m_flipped ? fromRect.y : m_size.height - fromRect.maxY();
        whole = {rect.x - fromRect.x * scaleX, rect.y - top * scaleY, m_size.width * scaleX,
                 m_size.height * scaleY};
        painter.setClipRect(KXQtRect(rect), Qt::IntersectClip);
    }
    rep->drawInRect(painter, whole);
    painter.restore();
}
