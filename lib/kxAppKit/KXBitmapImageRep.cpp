#include "lib/kxAppKit/KXBitmapImageRep.h"

#include "lib/base/Geometry.h"
#include "lib/base/Log.h"
#include "lib/base/SharedBytes.h"
#include "lib/kxAppKit/KXImageRep.h"
#include "lib/kxAppKit/KXQtGeometry.h"
#include "lib/kxAppKit/KXTiff.h"
#include "lib/raster/rasterops.h"

#include <QPainter>
#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <memory>
#include <new>
#include <string>

static_assert(std::endian::native == std::endian::little,
              "Images with words as pixels are read as B, G, R, A.");

namespace {

/// Rows that cross cache lines take longer to write.
constexpr std::align_val_t cacheLine{64};
constexpr std::int32_t alphaBits = 32;
constexpr std::int64_t largestBitmap = std::numeric_limits<std::int32_t>::max();
constexpr KXBitmapFormat knownFormats = KXAlphaFirstBitmapFormat | KXAlphaNonpremultipliedBitmapFormat;

std::int64_t rowLength(std::int32_t pixelsWide) {
    return static_cast<std::int64_t>(pixelsWide) * 4;
}

bool isKnown(KXBitmapFormat format) {
    return (format & ~knownFormats) == 0;
}

int alphaByte(KXBitmapFormat format) {
    return format & KXAlphaFirstBitmapFormat ? 0 : 3;
}

RasterBlock blockOf(KXBitmapImageRep& bitmap) {
    return {bitmap.bitmapData(), bitmap.bytesPerRow(), static_cast<std::size_t>(bitmap.pixelsWide()),
            static_cast<std::size_t>(bitmap.pixelsHigh())};
}

} // namespace

void KXBitmapImageRep::Freed::operator()(std::uint8_t* memory) const {
    ::operator delete(memory, cacheLine);
}

KXBitmapImageRep::KXBitmapImageRep(Key, std::int32_t wide, std::int32_t high, std::int32_t bitsPerPixel,
                                   std::int32_t bytesPerRow)
    : KXImageRep({static_cast<float>(wide), static_cast<float>(high)})
    , m_pixelsWide(wide)
    , m_pixelsHigh(high)
    , m_bytesPerRow(bytesPerRow)
    , m_bitsPerPixel(bitsPerPixel)
    , m_colorSpaceName("NSCalibratedRGBColorSpace") {}

KXBitmapImageRep::Pointer KXBitmapImageRep::create(std::uint8_t* buffer, std::int32_t wide, std::int32_t high,
                                                   std::int32_t bitsPerPixel, std::int32_t bytesPerRow,
                                                   Memory memory) {
    const std::int64_t size = static_cast<std::int64_t>(bytesPerRow) * high;
    if (size > largestBitmap) return nullptr;
    auto bitmap = std::make_shared<KXBitmapImageRep>(Key{}, wide, high, bitsPerPixel, bytesPerRow);
    if (!buffer) {
        const auto bytes = static_cast<std::size_t>(size);
        void* const own = ::operator new(bytes, cacheLine, std::nothrow);
        if (own && memory == Memory::cleared) std::memset(own, 0, bytes);
        bitmap->m_ownMemory.reset(static_cast<std::uint8_t*>(own));
        buffer = bitmap->m_ownMemory.get();
    }
    bitmap->m_data = buffer;
    return buffer ? bitmap : nullptr;
}

KXBitmapImageRep::Pointer KXBitmapImageRep::imageRepWith32bitBuffer(std::uint8_t* buffer, std::int32_t wide,
                                                                    std::int32_t high, KXBitmapFormat format,
                                                                    std::int32_t bytesPerRow) {
    constexpr auto method = "+[NSBitmapImageRep(KXAppKitAdditions) "
                            "imageRepWith32bitBuffer:pixelsWide:pixelsHigh:bitmapFormat:bytesPerRow:]";
    const bool openRowLength = !buffer && bytesPerRow == 0;
    if (wide < 1 || high < 1 || !isKnown(format) || (!openRowLength && bytesPerRow < rowLength(wide))) {
        Log("%s: invalid bitmap creation parameters: buffer=%p, width=%d, height=%d, format=%d, "
            "bytesPerRow=%d\n",
            method, static_cast<void*>(buffer), wide, high, static_cast<int>(format), bytesPerRow);
        return nullptr;
    }
    Pointer bitmap;
    if (rowLength(wide) <= largestBitmap) {
        const auto length = openRowLength ? static_cast<std::int32_t>(rowLength(wide)) : bytesPerRow;
        bitmap = create(buffer, wide, high, alphaBits, length, Memory::cleared);
    }
    if (!bitmap) {
        Log("%s: could not create bitmap with parameters: buffer=%p, width=%d, height=%d, format=%d, "
            "bytesPerRow=%d\n",
            method, static_cast<void*>(buffer), wide, high, static_cast<int>(format), bytesPerRow);
        return nullptr;
    }
    bitmap->m_bitmapFormat = format;
    return bitmap;
}

KXBitmapImageRep::Pointer KXBitmapImageRep::imageRepFromFlippedBGRABuffer(const std::uint8_t* buffer,
                                                                          std::int32_t wide,
                                                                          std::int32_t high,
                                                                          std::int32_t bytesPerRow) {
    if (!buffer || wide <= 0 || high <= 0 || bytesPerRow < rowLength(wide)) {
        Log("%s: invalid BGRA bitmap parameters: buffer=%p, width=%d, height=%d, bytesPerRow=%d\n",
            "+[NSBitmapImageRep(KXAppKitAdditions) "
            "imageRepFromFlippedBGRABuffer:pixelsWide:pixelsHigh:bytesPerRow:]",
            static_cast<const void*>(buffer), wide, high, bytesPerRow);
        return nullptr;
    }
    constexpr KXBitmapFormat straightARGB = KXAlphaFirstBitmapFormat | KXAlphaNonpremultipliedBitmapFormat;
    // The memory need not be cleared: every pixel is written. A refusal is logged as any other.
    const auto length = static_cast<std::int32_t>(rowLength(wide));
    Pointer bitmap = create(nullptr, wide, high, alphaBits, length, Memory::uninitialised);
    if (!bitmap) return imageRepWith32bitBuffer(nullptr, wide, high, straightARGB, 0);
    bitmap->m_bitmapFormat = straightARGB;
    // Not bytesPerRow, which would look right: the rows always follow one another.
    Raster_PermuteFlipped(blockOf(*bitmap), buffer, length, rasterBGRAToARGB);
    return bitmap;
}

KXBitmapImageRep::Pointer KXBitmapImageRep::imageRepWithPixels(std::int32_t wide, std::int32_t high,
                                                               std::int32_t bitsPerPixel) {
    const std::int64_t length = static_cast<std::int64_t>(wide) * bitsPerPixel / 8;
    if (wide < 1 || high < 1 || (bitsPerPixel != 24 && bitsPerPixel != alphaBits) || length > largestBitmap)
        return nullptr;
    return create(nullptr, wide, high, bitsPerPixel, static_cast<std::int32_t>(length), Memory::cleared);
}

KXBitmapImageRep::Pointer KXBitmapImageRep::imageRepWithData(const SharedBytes& tiff) {
    return KXTiff::firstPicture(tiff);
}

KXSize KXBitmapImageRep::pixelSize() const {
    return {static_cast<float>(m_pixelsWide), static_cast<float>(m_pixelsHigh)};
}

std::string KXBitmapImageRep::description() const {
    return "KXBitmapImageRep Pixels=" + std::to_string(m_pixelsWide) + "x" + std::to_string(m_pixelsHigh) +
           " BPP=" + std::to_string(m_bitsPerPixel) + " Alpha=" + (hasAlpha() ? "YES" : "NO") +
           " Planar=NO Format=" + std::to_string(m_bitmapFormat) +
           " BytesPerRow=" + std::to_string(m_bytesPerRow) + " ColorSpace=" + m_colorSpaceName;
}

bool KXBitmapImageRep::is32bitNonPlanarRGBWithAlpha() const {
    return bitsPerPixel() == alphaBits && samplesPerPixel() == 4 && !isPlanar() && hasAlpha();
}

bool KXBitmapImageRep::colorProfileMatchesBitmap(const KXBitmapImageRep& other) const {
    return m_colorSpaceName == other.m_colorSpaceName &&
           m_colorSyncProfileData == other.m_colorSyncProfileData;
}

void KXBitmapImageRep::setColorProfileFromBitmap(const KXBitmapImageRep& other) {
    m_colorSpaceName = other.m_colorSpaceName;
    m_colorSyncProfileData = other.m_colorSyncProfileData;
}

bool KXBitmapImageRep::convertBitmapDataFromFormat(KXBitmapFormat from, KXBitmapFormat to) {
    // Even when there is nothing to convert.
    if (!isKnown(from) || !isKnown(to) || !is32bitNonPlanarRGBWithAlpha()) {
        Log("%s: invalid bitmap conversion parameters: srcFormat=%d, dstFormat=%d, bitmap: %s\n",
            "-[NSBitmapImageRep(KXAppKitAdditions) convertBitmapDataFromFormat:toFormat:]",
            static_cast<int>(from), static_cast<int>(to), description().c_str());
        return false;
    }
    const KXBitmapFormat changed = from ^ to;
    const RasterBlock block = blockOf(*this);
    if (changed & KXAlphaNonpremultipliedBitmapFormat) {
        if (from & KXAlphaNonpremultipliedBitmapFormat)
            Raster_Premultiply(block, alphaByte(from));
        else
            Raster_Unpremultiply(block, alphaByte(from));
    }
    if (changed & KXAlphaFirstBitmapFormat)
        Raster_Permute(block, from & KXAlphaFirstBitmapFormat ? rasterARGBToRGBA : rasterRGBAToARGB);
    return true;
}

SharedBytes KXBitmapImageRep::TIFFRepresentation() const {
    const KXBitmapImageRep* const pictures[] = {this};
    return KXTiff::write(pictures);
}

QImage KXBitmapImageRep::createCGImageRef() const {
    const Pointer copy = imageRepWithData(TIFFRepresentation());
    return copy ? copy->imageView().copy() : QImage();
}

QImage::Format KXBitmapImageRep::viewFormat() const {
    const bool wordAligned = reinterpret_cast<std::uintptr_t>(m_data) % 4 == 0 && m_bytesPerRow % 4 == 0;
    if (m_bitsPerPixel == 24) return QImage::Format_RGB888;
    if (!wordAligned || m_bitmapFormat & KXAlphaFirstBitmapFormat) return QImage::Format_Invalid;
    return m_bitmapFormat & KXAlphaNonpremultipliedBitmapFormat ? QImage::Format_RGBA8888
                                                                : QImage::Format_RGBA8888_Premultiplied;
}

QImage KXBitmapImageRep::imageView() {
    const QImage::Format format = viewFormat();
    if (format == QImage::Format_Invalid) return {};
    return QImage(m_data, m_pixelsWide, m_pixelsHigh, m_bytesPerRow, format);
}

QImage KXBitmapImageRep::imageView() const {
    const QImage::Format format = viewFormat();
    if (format == QImage::Format_Invalid) return {};
    return QImage(static_cast<const uchar*>(m_data), m_pixelsWide, m_pixelsHigh, m_bytesPerRow, format);
}

QImage KXBitmapImageRep::premultipliedImage() const {
    if (!hasAlpha()) return imageView().convertToFormat(QImage::Format_ARGB32_Premultiplied);
    constexpr RasterChannelMap rgbaToBGRA{2, 1, 0, 3};
    constexpr RasterChannelMap argbToBGRA{3, 2, 1, 0};
    QImage image(m_pixelsWide, m_pixelsHigh, QImage::Format_ARGB32_Premultiplied);
    if (image.isNull()) return image;
    const RasterBlock block{image.bits(), image.bytesPerLine(), static_cast<std::size_t>(m_pixelsWide),
                            static_cast<std::size_t>(m_pixelsHigh)};
    Raster_CopyBlock({block.data, block.bytesPerRow}, {m_data, m_bytesPerRow}, 4,
                     RasterRect::fromSize(0, 0, m_pixelsWide, m_pixelsHigh), 0, 0);
    Raster_Permute(block, m_bitmapFormat & KXAlphaFirstBitmapFormat ? argbToBGRA : rgbaToBGRA);
    if (m_bitmapFormat & KXAlphaNonpremultipliedBitmapFormat) Raster_Premultiply(block, 3);
    return image;
}

void KXBitmapImageRep::drawInRect(QPainter& painter, const KXRect& rect) const {
    const QRectF target = KXQtRect(rect);
    QImage image = imageView();
    if (image.isNull()) image = premultipliedImage();
    const QSizeF device = painter.deviceTransform().mapRect(target).size();
    const bool shrinks = device.width() < m_pixelsWide || device.height() < m_pixelsHigh;
    // The painter's own filter looks at four pixels only, which is not enough for a reduction.
    if (shrinks && painter.testRenderHint(QPainter::SmoothPixmapTransform)) {
        // Bounded before they become integers: a rectangle may be as large as a float allows.
        const auto bounded = [](qreal length, std::int32_t most) {
            return static_cast<int>(std::clamp(std::round(length), 1.0, static_cast<qreal>(most)));
        };
        const QSize pixels(bounded(device.width(), m_pixelsWide), bounded(device.height(), m_pixelsHigh));
        image = image.scaled(pixels, Qt::IgnoreAspectRatio, Qt::SmoothTransformation);
    }
    painter.drawImage(target, image);
}
