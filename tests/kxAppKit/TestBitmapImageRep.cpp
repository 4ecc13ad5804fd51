#include "lib/kxAppKit/KXBitmapImageRep.h"
#include "lib/kxAppKit/KXQtGeometry.h"
#include "tests/support/ScratchHome.h"

#include <QPainter>
#include <algorithm>
#include <gtest/gtest.h>
#include <limits>
#include <vector>

namespace {

using Bytes = std::vector<std::uint8_t>;
using Bitmap = KXBitmapImageRep;
using Interpolation = KXImageInterpolation;

Bitmap::Pointer bitmap(int wide, int high, KXBitmapFormat format = 0, const Bytes& pixel = {}) {
    auto made = Bitmap::imageRepWith32bitBuffer(nullptr, wide, high, format, 0);
    for (std::ptrdiff_t i = 0; !pixel.empty() && i < std::ptrdiff_t{wide} * high; ++i)
        std::copy(pixel.begin(), pixel.end(), made->bitmapData() + i * 4);
    return made;
}

Bytes pixelAt(const Bitmap& from, std::ptrdiff_t x, std::ptrdiff_t y) {
    const std::uint8_t* const p = from.bitmapData() + y * from.bytesPerRow() + x * 4;
    return {p, p + 4};
}

/// It does nothing but log exactly one entry, with this text in it.
void expectRefused(const std::string& text, auto&& call) {
    const ScratchHome home;
    EXPECT_FALSE(call());
    EXPECT_EQ(ScratchHome::logged("\n"), 1) << ScratchHome::log();
    EXPECT_EQ(ScratchHome::logged(text), 1) << ScratchHome::log() << " lacks " << text;
}

TEST(Bitmap, CreationChecksItsParameters) {
    Bytes memory(64, 9);
    const struct {
        std::uint8_t* buffer;
        int wide, high;
        KXBitmapFormat format;
        int bytesPerRow;
        const char* complaint;
    } cases[] = {
        {nullptr, 4, 4, 0, 15,
         "imageRepWith32bitBuffer:pixelsWide:pixelsHigh:bitmapFormat:bytesPerRow:]: invalid bitmap creation "
         "parameters: buffer=(nil), width=4, height=4, format=0, bytesPerRow=15\n"},
        {memory.data(), 4, 4, 0, 0, "buffer=0x"},
        {memory.data(), 4, 4, 0, 15, "invalid"},
        {nullptr, 0, 4, 0, 0, "invalid"},
        {nullptr, 4, -1, 0, 0, "invalid"},
        {nullptr, 4, 4, 4, 0, "format=4"},
        {memory.data(), 0x40000001, 1, 0, 4, "invalid"},
        {memory.data(), 1, 1, 0, -4, "invalid"},
        {nullptr, 0x40000001, 1, 0, 0,
         "could not create bitmap with parameters: buffer=(nil), width=1073741825, "
         "height=1, format=0, bytesPerRow=0\n"},
        {nullptr, 65536, 65537, 0, 0, "could not create"},
        {memory.data(), 1, std::numeric_limits<int>::max(), 0, 64, "could not create"},
    };
    for (const auto& c : cases)
        expectRefused(c.complaint, [&] {
            return Bitmap::imageRepWith32bitBuffer(c.buffer, c.wide, c.high, c.format, c.bytesPerRow);
        });
    EXPECT_EQ(pixelAt(*bitmap(3, 2), 2, 1), Bytes(4)) << "cleared";
    const auto over = Bitmap::imageRepWith32bitBuffer(memory.data(), 3, 4, 3, 16);
    memory[3 * 16 + 2 * 4] = 1;
    EXPECT_EQ(pixelAt(*over, 2, 3), (Bytes{1, 9, 9, 9})) << "the caller's memory is used as it is";
}

TEST(Bitmap, IconBuffersAreFlippedAndReordered) {
    const Bytes rows{0x10, 0x20, 0x30, 0xFF, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12};
    const auto icon = Bitmap::imageRepFromFlippedBGRABuffer(rows.data(), 2, 2, 99);
    ASSERT_TRUE(icon);
    EXPECT_EQ(icon->bitmapFormat(), 3U);
    EXPECT_EQ(pixelAt(*icon, 0, 1), (Bytes{0xFF, 0x30, 0x20, 0x10}));
    EXPECT_EQ(pixelAt(*icon, 0, 0), (Bytes{8, 7, 6, 5}))
        << "rows follow one another, whatever their length is said to be";
    expectRefused("pixelsWide:pixelsHigh:bytesPerRow:]: invalid BGRA bitmap parameters: buffer=0x",
                  [&] { return Bitmap::imageRepFromFlippedBGRABuffer(rows.data(), 0x40000001, 1, 4); });
    const ScratchHome home;
    EXPECT_FALSE(Bitmap::imageRepFromFlippedBGRABuffer(nullptr, 1, 1, 4));
}

TEST(Bitmap, ConvertsBetweenItsLayouts) {
    const struct {
        KXBitmapFormat from, to;
        Bytes before, after;
    } cases[] = {
        {3, 0, {128, 255, 0, 0}, {128, 0, 0, 128}}, {0, 3, {128, 0, 0, 128}, {128, 255, 0, 0}},
        {2, 1, {255, 100, 0, 51}, {51, 51, 20, 0}}, {1, 0, {4, 1, 2, 3}, {1, 2, 3, 4}},
        {2, 2, {9, 9, 9, 1}, {9, 9, 9, 1}},         {0, 2, {9, 9, 9, 0}, {0, 0, 0, 0}},
    };
    for (const auto& [from, to, before, after] : cases) {
        const auto made = bitmap(3, 1, from, before);
        EXPECT_TRUE(made->convertBitmapDataFromFormat(from, to));
        EXPECT_EQ(pixelAt(*made, 2, 0), after) << from << " to " << to;
        EXPECT_EQ(made->bitmapFormat(), from) << "what is declared stays";
    }
    expectRefused(": invalid bitmap conversion parameters: srcFormat=4, dstFormat=4, bitmap: ",
                  [] { return bitmap(1, 1)->convertBitmapDataFromFormat(4, 4); });
    const ScratchHome home;
    EXPECT_FALSE(Bitmap::imageRepWithPixels(2, 2, 24)->convertBitmapDataFromFormat(0, 1));
}

TEST(Bitmap, CopiesBlocksFromTheBottomLeft) {
    const Bytes red{255, 0, 0, 255};
    const auto source = bitmap(4, 4, 0, red);
    const std::pair<KXPoint, QRect> cases[] = {{{0, 0}, {0, 4, 4, 4}},   {{6, 7}, {6, 0, 2, 1}},
                                               {{-3, -3}, {0, 7, 1, 1}}, {{8, 0}, {}},
                                               {{0, -1e30f}, {}},        {{1e38f, 1e38f}, {}}};
    for (const auto& [offset, covered] : cases) {
        const auto target = bitmap(8, 8);
        EXPECT_TRUE(source->copyBitmapDataIntoRep(*target, offset));
        for (int at = 0; at < 8 * 8; ++at)
            ASSERT_EQ(pixelAt(*target, at % 8, at / 8) == red, covered.contains(at % 8, at / 8))
                << offset.x << " at " << at;
    }
    expectRefused(": invalid bitmap copy parameters: offset={0.5, 0}, source=", [&] {
        return source->copyBitmapDataIntoRep(*bitmap(8, 8), {0.5f, 0});
    });
    const ScratchHome home;
    EXPECT_FALSE(source->copyBitmapDataIntoRep(*source, {}));
    EXPECT_FALSE(source->copyBitmapDataIntoRep(*bitmap(8, 8), {std::numeric_limits<float>::infinity(), 0}));
    EXPECT_FALSE(source->copyBitmapDataIntoRep(*Bitmap::imageRepWithPixels(8, 8, 24), {}));
}

TEST(Bitmap, MultipliesOnlyWhatItCovers) {
    const auto black = bitmap(2, 2, 3, {255, 0, 0, 0});
    const auto target = bitmap(4, 4, 0, {200, 100, 50, 250});
    EXPECT_TRUE(black->multiplyPixelDataIntoBitmapRep(*target, {3, 3}));
    EXPECT_EQ(pixelAt(*target, 3, 0), (Bytes{0, 0, 0, 250}));
    EXPECT_EQ(pixelAt(*target, 2, 0), (Bytes{200, 100, 50, 250}));
    EXPECT_EQ(pixelAt(*target, 3, 1), (Bytes{200, 100, 50, 250}));
    target->setColorSpaceName("NSDeviceRGBColorSpace");
    expectRefused("multiplyPixelDataIntoBitmapRep:offset:]: invalid parameters: offset={0, 0}, source=",
                  [&] { return black->multiplyPixelDataIntoBitmapRep(*target, {}); });
}

TEST(Bitmap, EnlargesOnlyOntoTheWholeOfItsLike) {
    const auto source = bitmap(2, 2, 1, {255, 255, 255, 255});
    const auto target = bitmap(4, 4, 1);
    EXPECT_TRUE(source->drawWithBilinearScalingIntoBitmapRep(*target, {0, 0, 4, 4}));
    EXPECT_EQ(pixelAt(*target, 3, 3), Bytes(4, 253));
    const struct {
        Bitmap::Pointer source, target;
        KXRect rect;
    } refused[] = {{source, target, {0, 0, 3, 4}},
                   {source, bitmap(4, 4, 0), {0, 0, 4, 4}},
                   {bitmap(2, 2, 3), bitmap(4, 4, 3), {0, 0, 4, 4}},
                   {source, Bitmap::imageRepWithPixels(4, 4, 24), {0, 0, 4, 4}}};
    for (const auto& c : refused)
        expectRefused("IntoBitmapRep:targetRect:]: invalid bitmap scale parameters: rect={{0, 0}, ",
                      [&] { return c.source->drawWithBilinearScalingIntoBitmapRep(*c.target, c.rect); });
    expectRefused(": error scaling bitmap: rect={{0, 0}, {32768, 1}}, source=", [] {
        return bitmap(1, 1)->drawWithBilinearScalingIntoBitmapRep(*bitmap(32768, 1), {0, 0, 32768, 1});
    });
}

/// Anything that is no bitmap: fills its rectangle.
struct Fill : KXImageRep {
    QColor color;
    Fill(KXSize size, QColor c)
        : KXImageRep(size)
        , color(c) {}
    void drawInRect(QPainter& painter, const KXRect& r) const override {
        painter.fillRect(KXQtRect(r), color);
    }
};

TEST(Bitmap, DrawsIntoEveryLayout) {
    const Fill halfRed({4, 4}, QColor(255, 0, 0, 128));
    const auto icon = bitmap(2, 2, 3, {128, 255, 0, 0});
    const auto premultiplied = bitmap(2, 2, 1, {128, 128, 0, 0});
    const Bytes red[] = {{128, 0, 0, 128}, {128, 128, 0, 0}, {255, 0, 0, 128}, {128, 255, 0, 0}};
    const Bytes before{7, 60, 50, 40}; // no premultiplied pixel, whatever the layout
    const KXImageRep* const sources[] = {&halfRed, icon.get(), premultiplied.get()};
    const KXRect rects[] = {{2, 1, 2, 2}, {1, 0, 3, 5}, {0, 0, 6, 6}, {-1, 4, 3, 9}, {9, 0, 2, 2}};
    for (KXBitmapFormat round = 0; round < 4 * 3; ++round)
        for (const KXRect& rect : rects) {
            const KXBitmapFormat format = round % 4;
            const auto target = bitmap(6, 6, format, before);
            ASSERT_TRUE(sources[round / 4]->drawIntoBitmapRep(*target, rect, Interpolation::high));
            for (int at = 0; at < 6 * 6 * 4; ++at) {
                const int x = at / 4 % 6, y = at / 24;
                const auto channel = static_cast<std::size_t>(at % 4);
                const bool inside = KXQtRect(rect).contains(QPointF(x + 0.5, 5.5 - y));
                ASSERT_NEAR(target->bitmapData()[at], (inside ? red[format] : before)[channel],
                            inside ? 2 : 0)
                    << "format " << format << " rect " << rect.x << " at " << x << ", " << y;
            }
        }
}

TEST(Bitmap, FractionalRectanglesLeaveOtherPixelsAlone) {
    const Fill white({1, 1}, Qt::white);
    for (KXBitmapFormat format = 0; format < 4; ++format) {
        const auto target = bitmap(6, 6, format, {1, 60, 50, 40});
        EXPECT_TRUE(white.drawIntoBitmapRep(*target, {1.5f, 1, 2, 2}, Interpolation::high));
        EXPECT_EQ(pixelAt(*target, 0, 4), (Bytes{1, 60, 50, 40}));
        EXPECT_EQ(pixelAt(*target, 4, 4), (Bytes{1, 60, 50, 40}));
        EXPECT_EQ(pixelAt(*target, 2, 4), Bytes(4, 255));
        EXPECT_NE(pixelAt(*target, 1, 4), Bytes(4, 255)) << "half covered";
    }
}

TEST(Bitmap, DrawsOnRowsAtOddAddressesAndOverHugeRectangles) {
    Bytes memory(4 * 25 + 1, 7);
    const auto odd = Bitmap::imageRepWith32bitBuffer(memory.data() + 1, 4, 4, 0, 25);
    EXPECT_TRUE(Fill({1, 1}, Qt::white).drawIntoBitmapRep(*odd, {1, 0, 2, 4}, Interpolation::none));
    EXPECT_EQ(pixelAt(*odd, 1, 3), Bytes(4, 255));
    EXPECT_EQ(pixelAt(*odd, 0, 3), Bytes(4, 7));
    EXPECT_EQ(memory[1 + 16], 7) << "between the rows";
    const auto target = bitmap(4, 4);
    const auto source = bitmap(2, 2, 0, {9, 9, 9, 255});
    for (const KXRect& rect : {KXRect{-1e30f, -1e30f, 2e30f, 2e30f}, KXRect{0, 0, 4e9f, 3},
                               KXRect{0, 0, 4e12f, 1}, KXRect{1, 1, 1e-30f, 2}})
        EXPECT_TRUE(source->drawIntoBitmapRep(*target, rect, Interpolation::high));
    expectRefused("interpolation:]: Invalid target for drawing into: rect {{0, 0}, {0, 4}}, target ", [&] {
        return source->drawIntoBitmapRep(*target, {0, 0, 0, 4}, Interpolation::high);
    });
    const ScratchHome home;
    EXPECT_FALSE(Fill({0, 1}, Qt::white).drawIntoBitmapRep(*target, {0, 0, 4, 4}, Interpolation::high));
    EXPECT_FALSE(
        source->drawIntoBitmapRep(*Bitmap::imageRepWithPixels(4, 4, 24), {0, 0, 4, 4}, Interpolation::high));
}

TEST(Bitmap, GoesThroughTiffAndBack) {
    const char profile[] = "not really a profile";
    for (KXBitmapFormat format = 0; format < 4; ++format) {
        const auto original =
            bitmap(5, 3, format, format & 1 ? Bytes{128, 100, 50, 25} : Bytes{100, 50, 25, 128});
        original->bitmapData()[(format & 1) + 4] = 99;
        original->setColorSyncProfileData(SharedBytes::copyOf(profile, sizeof profile));
        const auto copy = Bitmap::imageRepWithData(original->TIFFRepresentation());
        ASSERT_TRUE(copy);
        EXPECT_EQ(copy->bitmapFormat(), format & 2U);
        EXPECT_EQ(pixelAt(*copy, 1, 0), (Bytes{99, 50, 25, 128}));
        EXPECT_EQ(pixelAt(*copy, 4, 2), (Bytes{100, 50, 25, 128}));
        EXPECT_TRUE(copy->colorProfileMatchesBitmap(*original));
        EXPECT_EQ(qAlpha(original->createCGImageRef().pixel(4, 2)), 128);
    }
    const auto opaque = Bitmap::imageRepWithPixels(2, 2, 24);
    opaque->bitmapData()[11] = 77;
    const auto copy = Bitmap::imageRepWithData(opaque->TIFFRepresentation());
    EXPECT_FALSE(copy->hasAlpha());
    EXPECT_EQ(copy->bitmapData()[11], 77);
    opaque->setColorSyncProfileData(SharedBytes::copyOf(profile, 3));
    EXPECT_FALSE(copy->colorProfileMatchesBitmap(*opaque));
    const ScratchHome home;
    for (const std::size_t size : {0U, 7U, 100U})
        EXPECT_FALSE(Bitmap::imageRepWithData(opaque->TIFFRepresentation().slice(0, size))) << size;
}

} // namespace
