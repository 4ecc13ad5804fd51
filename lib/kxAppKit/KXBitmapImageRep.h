#pragma once

#include "lib/base/SharedBytes.h"
#include "lib/kxAppKit/KXImageRep.h"

#include <QImage>
#include <cstdint>
#include <memory>
#include <string>

/// The two bits that lay out a 32-bit bitmap. Clear: R, G, B, A in memory, colours premultiplied by alpha.
using KXBitmapFormat = std::uint32_t;
constexpr KXBitmapFormat KXAlphaFirstBitmapFormat = 1;            ///< A, R, G, B in memory
constexpr KXBitmapFormat KXAlphaNonpremultipliedBitmapFormat = 2; ///< colours not multiplied by alpha

/// Pixels in memory of its own or the caller's, top row first, 8 bits a sample, meshed. One point is one
/// pixel unless set otherwise. `offset` arguments count from the bottom left corner of the target.
class KXBitmapImageRep : public KXImageRep {
    struct Key {};

public:
    using Pointer = std::shared_ptr<KXBitmapImageRep>;

    /// A 32-bit bitmap; null when refused. `buffer` null: memory of its own, cleared, where `bytesPerRow` 0
    /// leaves the row length open. Else the caller's memory, which must outlive the bitmap.
    static Pointer imageRepWith32bitBuffer(std::uint8_t* buffer, std::int32_t pixelsWide,
                                           std::int32_t pixelsHigh, KXBitmapFormat bitmapFormat,
                                           std::int32_t bytesPerRow);
    /// A new bitmap of format 3 from rows of blue, green, red, alpha that begin with the lowest row. The rows
    /// are read `pixelsWide` x 4 bytes apart, whatever `bytesPerRow` says: that is only checked.
    static Pointer imageRepFromFlippedBGRABuffer(const std::uint8_t* buffer, std::int32_t pixelsWide,
                                                 std::int32_t pixelsHigh, std::int32_t bytesPerRow);
    /// Cleared pixels of 32 bits, format 0, or of 24, without alpha; null when that is too much.
    static Pointer imageRepWithPixels(std::int32_t pixelsWide, std::int32_t pixelsHigh,
                                      std::int32_t bitsPerPixel);
    /// The first picture of TIFF data; null when there is none. Without alpha it has 24 bits a pixel.
    static Pointer imageRepWithData(const SharedBytes& tiff);

    std::int32_t pixelsWide() const { return m_pixelsWide; }
    std::int32_t pixelsHigh() const { return m_pixelsHigh; }
    std::int32_t bytesPerRow() const { return m_bytesPerRow; }
    std::int32_t bitsPerPixel() const { return m_bitsPerPixel; }
    std::int32_t samplesPerPixel() const { return m_bitsPerPixel / 8; }
    bool hasAlpha() const { return m_bitsPerPixel == 32; }
    bool isPlanar() const { return false; }
    KXBitmapFormat bitmapFormat() const { return m_bitmapFormat; }
    std::uint8_t* bitmapData() { return m_data; }
    const std::uint8_t* bitmapData() const { return m_data; }
    KXSize pixelSize() const override;
    std::string description() const;
    bool is32bitNonPlanarRGBWithAlpha() const;

    /// Empty is none.
    const std::string& colorSpaceName() const { return m_colorSpaceName; }
    void setColorSpaceName(std::string name) { m_colorSpaceName = std::move(name); }
    const SharedBytes& colorSyncProfileData() const { return m_colorSyncProfileData; } ///< ICC bytes
    void setColorSyncProfileData(SharedBytes profile) { m_colorSyncProfileData = std::move(profile); }
    bool colorProfileMatchesBitmap(const KXBitmapImageRep& other) const;
    void setColorProfileFromBitmap(const KXBitmapImageRep& other);

    /// Converts the pixels in place; what `bitmapFormat` declares stays as it is.
    bool convertBitmapDataFromFormat(KXBitmapFormat from, KXBitmapFormat to);
    /// Copies bytes, without any conversion; what lies outside the target is left out.
    bool copyBitmapDataIntoRep(KXBitmapImageRep& target, KXPoint offset) const;
    /// Enlarges onto the whole of `target`.
    bool drawWithBilinearScalingIntoBitmapRep(KXBitmapImageRep& target, const KXRect& rect) const;
    /// Darkens the target with the colours of this bitmap where it is opaque. The target's alpha stays.
    bool multiplyPixelDataIntoBitmapRep(KXBitmapImageRep& target, KXPoint offset) const;

    void drawInRect(QPainter& painter, const KXRect& rect) const override;

    SharedBytes TIFFRepresentation() const;
    /// A copy of the picture, by way of its TIFF data; a null image when that fails.
    QImage createCGImageRef() const;

    /// The same memory as an image, to read or to paint on, where the layout is one of the toolkit's (alpha
    /// last, or none) and the rows are aligned; else a null image. Must not outlive the bitmap.
    QImage imageView();
    QImage imageView() const;
    /// A copy as premultiplied ARGB32, what painting on a window takes fastest.
    QImage premultipliedImage() const;

    KXBitmapImageRep(Key, std::int32_t pixelsWide, std::int32_t pixelsHigh, std::int32_t bitsPerPixel,
                     std::int32_t bytesPerRow);

private:
    struct Freed {
        void operator()(std::uint8_t* memory) const;
    };
    enum class Memory { cleared, uninitialised };

    static Pointer create(std::uint8_t* buffer, std::int32_t pixelsWide, std::int32_t pixelsHigh,
                          std::int32_t bitsPerPixel, std::int32_t bytesPerRow, Memory memory);
    QImage::Format viewFormat() const;

    std::unique_ptr<std::uint8_t, Freed> m_ownMemory;
    std::uint8_t* m_data = nullptr;
    std::int32_t m_pixelsWide;
    std::int32_t m_pixelsHigh;
    std::int32_t m_bytesPerRow;
    std::int32_t m_bitsPerPixel;
    KXBitmapFormat m_bitmapFormat = 0;
    std::string m_colorSpaceName;
    SharedBytes m_colorSyncProfileData;
};
