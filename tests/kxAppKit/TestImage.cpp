#include "lib/kxAppKit/KXBitmapImageRep.h"
#include "lib/kxAppKit/KXFileTypeIcons.h"
#include "lib/kxAppKit/KXImage.h"
#include "lib/plist/Value.h"
#include "platform/FileTypeIcons.h"
#include "tests/support/ScratchHome.h"

#include <QPainter>
#include <algorithm>
#include <gtest/gtest.h>

namespace {

using Operation = KXCompositingOperation;

plist::Value rawIcon(int width, int height, std::size_t bytes, plist::Value format = "bgra") {
    std::vector<std::uint8_t> pixels(bytes);
    for (std::size_t i = 0; i < bytes; ++i)
        pixels[i] = std::array<std::uint8_t, 4>{0x10, 0x20, 0x30, 0xFF}[i % 4];
    return plist::Dictionary{{"format", format},
                             {"width", width},
                             {"height", height},
                             {"data", SharedBytes::copyOf(pixels.data(), bytes)}};
}

KXImageRep::Pointer filled(int wide, int high, QColor color = Qt::red) {
    auto rep = KXBitmapImageRep::imageRepWith32bitBuffer(nullptr, wide, high, 0, 0);
    rep->imageView().fill(color);
    return rep;
}

KXImage::Pointer imageOf(std::initializer_list<KXSize> sizes) {
    std::vector<KXImageRep::Pointer> reps;
    for (const KXSize& size : sizes)
        reps.push_back(filled(static_cast<int>(size.width), static_cast<int>(size.height)));
    return KXImage::imageWithRepresentations(reps);
}

QRgb pixelOf(const KXImage::Pointer& image, int x, int y) {
    return image->bitmapImageRep()->premultipliedImage().pixel(x, y);
}

TEST(Image, KeepsTheValidIconsOfARawSet) {
    const ScratchHome home;
    const auto image = KXImage::imageWithRawIcons(
        plist::Array{rawIcon(16, 16, 1024), rawIcon(2, 2, 16, "BGRA"), rawIcon(2, 2, 15), rawIcon(2, 2, 17),
                     rawIcon(0, 0, 0), rawIcon(0x40000001, 1, 4), rawIcon(65536, 65537, 65536 * 4),
                     plist::Dictionary{}, rawIcon(32, 32, 4096)});
    ASSERT_TRUE(image);
    EXPECT_EQ(image->size(), (KXSize{32, 32}));
    ASSERT_EQ(image->representations().size(), 2U);
    EXPECT_EQ(image->representations()[0]->pixelSize(), (KXSize{16, 16}));
    EXPECT_EQ(pixelOf(image, 0, 15), qRgba(0x30, 0x20, 0x10, 0xFF));
    EXPECT_EQ(ScratchHome::logged("\n"), 7) << ScratchHome::log();
    for (const char* text :
         {"+[NSImage(KXAppKitAdditions) imageWithRawIcons:]: unknown icon format 'BGRA'\n",
          "icon has invalid size 15 for width=2, height=2\n", "unknown icon format '(null)'\n",
          "invalid BGRA bitmap parameters: buffer=", "could not create bitmap with parameters: buffer="})
        EXPECT_EQ(ScratchHome::logged(text), 1) << text << ScratchHome::log();

    EXPECT_FALSE(KXImage::imageWithRawIcons(plist::Array{}));
    EXPECT_FALSE(KXImage::imageWithRawIcons(plist::Array{rawIcon(2, 2, 15), "no dictionary"}));
    EXPECT_FALSE(KXImage::imageWithRawIcons(rawIcon(1, 1, 4)));
}

TEST(Image, PicksTheSmallestRepresentationThatIsLargeEnough) {
    const struct {
        std::initializer_list<KXSize> reps;
        KXSize wanted, best;
        bool smaller;
    } cases[] = {
        {{{16, 16}, {64, 64}, {128, 128}}, {32, 32}, {64, 64}, false},
        {{{128, 128}, {64, 64}}, {32, 32}, {64, 64}, false},
        {{{8, 8}, {16, 16}}, {32, 32}, {16, 16}, true},
        {{{64, 64}, {32, 32}}, {32, 32}, {32, 32}, false},
        {{{64, 32}, {64, 64}}, {32, 32}, {64, 64}, false}, // of equal scale, what covers more
        {{{31, 62}, {16, 8}}, {32, 32}, {31, 62}, false},
    };
    for (const auto& [reps, wanted, best, smaller] : cases) {
        bool isSmaller = !smaller;
        const auto found = imageOf(reps)->bestImageRepForSize(wanted, &isSmaller);
        ASSERT_TRUE(found);
        EXPECT_EQ(found->pixelSize(), best);
        EXPECT_EQ(isSmaller, smaller);
    }
    bool untouched = true;
    EXPECT_FALSE(imageOf({{8, 8}})->bestImageRepForSize({0, 8}, &untouched));
    EXPECT_TRUE(untouched);
    bool none = false;
    EXPECT_FALSE(KXImage().bestImageRepForSize({8, 8}, &none));
    EXPECT_TRUE(none);
}

TEST(Image, PicksByPointsInOrder) {
    const auto sizeFor = [](std::initializer_list<KXSize> reps, KXSize wanted) {
        return imageOf(reps)->imageRepForSize(wanted)->size().width;
    };
    EXPECT_EQ(sizeFor({{16, 16}, {64, 64}, {48, 48}}, {32, 32}), 16) << "a first one that is too small stays";
    EXPECT_EQ(sizeFor({{128, 128}, {48, 48}, {64, 64}}, {32, 32}), 48);
    EXPECT_EQ(sizeFor({{128, 128}, {16, 64}}, {32, 32}), 16) << "areas count, not shapes";
    EXPECT_FALSE(KXImage().imageRepForSize({1, 1}));
    EXPECT_TRUE(imageOf({{4, 4}})->bitmapImageRepForSize({9, 9}));
}

TEST(Image, ScalesToWholePixels) {
    const auto image = imageOf({{64, 32}});
    const auto kept = image->imageByScalingToSize({31.2f, 31.9f}, true, KXImageInterpolation::high);
    ASSERT_TRUE(kept);
    EXPECT_EQ(kept->size(), (KXSize{32, 32}));
    for (const auto& [y, alpha] : {std::pair{7, 0}, {8, 255}, {23, 255}, {24, 0}})
        EXPECT_EQ(qAlpha(pixelOf(kept, 16, y)), alpha) << y;
    EXPECT_EQ(
        qAlpha(pixelOf(image->imageByScalingToSize({32, 32}, false, KXImageInterpolation::none), 16, 0)),
        255);
    const ScratchHome home;
    EXPECT_FALSE(image->imageByScalingToSize({0, 5}, true, KXImageInterpolation::high));
    EXPECT_FALSE(KXImage().imageByScalingToSize({5, 5}, true, KXImageInterpolation::high));
    EXPECT_FALSE(image->imageByScalingToSize({4e9f, 5}, true, KXImageInterpolation::high));
    for (const char* text :
         {"interpolation:]: Invalid size for image creation: {0, 5}\n",
          "interpolation:]: Can't find image representation for size {5, 5}.\n", "could not create bitmap"})
        EXPECT_EQ(ScratchHome::logged(text), 1) << text;
}

TEST(Image, DrawsAtASizeOfItsOwn) {
    const auto image = imageOf({{64, 32}});
    EXPECT_EQ(image->scaledRectForFrame({0, 0, 33, 33}), (KXRect{0, 8, 33, 17}));
    EXPECT_EQ(image->maintainAspectRatioAndScaleToSize({32, 32})->size(), (KXSize{32, 16}));
    const auto resized = KXImage::initWithImage(*image, {5, 7}, KXImageInterpolation::high);
    EXPECT_EQ(resized->size(), (KXSize{5, 7}));
    EXPECT_EQ(pixelOf(resized, 4, 6), qRgb(255, 0, 0));
    EXPECT_EQ(KXImage::initWithImage(*image, {}, KXImageInterpolation::high)->representations(),
              image->representations());
    EXPECT_FALSE(KXImage::initWithImage(KXImage(), {5, 7}, KXImageInterpolation::high));
    EXPECT_EQ(pixelOf(image->representationForSize({3, 3}), 2, 2), qRgb(255, 0, 0));

    QImage picture(2, 2, QImage::Format_ARGB32);
    picture.fill(Qt::blue);
    const KXExtentImage extent{picture, {1, 0}};
    const auto moved = KXImage::imageWithCIImage(&extent);
    EXPECT_EQ(moved->size(), (KXSize{2, 2}));
    EXPECT_EQ(pixelOf(moved, 0, 1), 0U);
    EXPECT_EQ(pixelOf(moved, 1, 1), qRgb(0, 0, 255));
    EXPECT_FALSE(KXImage::imageWithCIImage(nullptr));
}

TEST(Image, DrawsPartsOfItselfUpright) {
    auto rep = std::static_pointer_cast<KXBitmapImageRep>(filled(4, 4, Qt::red));
    {
        QImage pixels = rep->imageView();
        QPainter painter(&pixels);
        painter.fillRect(0, 2, 4, 2, Qt::green); // the lower half
    }
    KXImage image({4, 4});
    image.addRepresentation(rep);
    QImage canvas(6, 2, QImage::Format_ARGB32_Premultiplied);
    canvas.fill(Qt::white);
    QPainter painter(&canvas);
    image.drawInRect(painter, {0, 0, 2, 2}, {}, Operation::sourceOver, 1);
    image.drawInRect(painter, {2, 0, 2, 2}, {0, 0, 4, 2}, Operation::sourceOver, 1);
    image.setFlipped(true);
    image.drawInRect(painter, {4, 0, 2, 2}, {0, 0, 4, 2}, Operation::sourceOver, 0.5f);
    EXPECT_EQ(canvas.pixel(0, 0), qRgb(255, 0, 0));
    EXPECT_EQ(canvas.pixel(0, 1), qRgb(0, 255, 0));
    EXPECT_EQ(canvas.pixel(2, 0), qRgb(0, 255, 0)) << "y counts from the bottom";
    EXPECT_NEAR(qGreen(canvas.pixel(4, 0)), 128, 1) << "y counts from the top, half transparent";
    EXPECT_EQ(qRed(canvas.pixel(5, 1)), 255);
}

TEST(Image, CombinesWithOverlays) {
    const auto image = imageOf({{4, 4}});
    const auto selected = image->selectedImage();
    EXPECT_NEAR(qRed(pixelOf(selected, 1, 1)), 166, 1);
    EXPECT_EQ(qAlpha(pixelOf(selected, 1, 1)), 255);
    KXImage half({4, 4});
    half.addRepresentation(filled(4, 4, QColor(0, 0, 255, 128)));
    EXPECT_NEAR(qBlue(pixelOf(image->imageByApplyingOverlay(half), 1, 1)), 128, 1);
    EXPECT_EQ(qAlpha(pixelOf(half.selectedImage(), 1, 1)), 128) << "only what is opaque grows darker";

    struct Icons : platform::FileTypeIcons {
        std::vector<platform::IconPixels> iconForFileType(const std::string& type) override {
            const std::uint8_t pixel[] = {0, 9, 0, 255};
            if (type != "'caut'") return {};
            return {{1, 1, SharedBytes::copyOf(pixel, 4)}, {2, 2, SharedBytes::copyOf(pixel, 4)}};
        }
    } icons;
    EXPECT_FALSE(KXImage::warningIcon()) << "no source";
    KXFileTypeIcons::setSource(&icons);
    ASSERT_TRUE(KXImage::warningIcon());
    EXPECT_EQ(KXImage::warningIcon()->representations().size(), 1U) << "too few bytes for the second";
    EXPECT_EQ(pixelOf(image->addBadgeWithType("caut"), 2, 2), qRgb(0, 9, 0));
    EXPECT_EQ(pixelOf(image->addBadgeWithType("none"), 2, 2), qRgb(255, 0, 0));
    KXFileTypeIcons::setSource(nullptr);
}

TEST(Image, GivesRowsASquareOfDevicePixels) {
    const auto image = imageOf({{16, 16}, {64, 32}});
    const QImage exact = image->squareImage(16);
    EXPECT_EQ(exact.size(), QSize(16, 16));
    EXPECT_EQ(exact.pixel(0, 0), qRgb(255, 0, 0));
    const QImage fitted = image->squareImage(20);
    EXPECT_EQ(qAlpha(fitted.pixel(10, 2)), 0);
    EXPECT_EQ(fitted.pixel(10, 10), qRgb(255, 0, 0));
    EXPECT_EQ(image->squareImage(20).cacheKey(), fitted.cacheKey());
    image->addRepresentation(filled(20, 20, Qt::blue));
    EXPECT_EQ(image->squareImage(20).pixel(10, 2), qRgb(0, 0, 255));
    EXPECT_TRUE(image->squareImage(0).isNull());
    EXPECT_TRUE(KXImage().squareImage(20).isNull());
}

} // namespace
