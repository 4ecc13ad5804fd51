#include "lib/kxAppKit/KXBitmapImageRep.h"
#include "lib/kxAppKit/KXFileTypeIcons.h"
#include "lib/kxAppKit/KXImage.h"
#include "lib/plist/Value.h"
#include "platform/FileTypeIcons.h"
#include "tests/support/ScratchHome.h"

#include <QPainter>
#include <QtEndian>
#include <gtest/gtest.h>
#include <map>

namespace {

plist::Value rawIcon(int width, int height, std::size_t bytes, plist::Value format = "bgra") {
    std::string pixels;
    while (pixels.size() < bytes)
        pixels += "\x10\x20\x30\xFF";
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

KXImage::Pointer square(int side, QColor color = Qt::red) {
    return KXImage::imageWithRepresentations({filled(side, side, color)});
}

QRgb pixelOf(const KXImage::Pointer& image, int x, int y) {
    return image->bitmapImageRep()->premultipliedImage().pixel(x, y);
}

TEST(Image, KeepsTheValidIconsOfARawSet) {
    const ScratchHome home;
    const auto image = KXImage::imageWithRawIcons(
        plist::Array{rawIcon(16, 16, 1024), rawIcon(2, 2, 16, "BGRA"), rawIcon(2, 2, 15), rawIcon(2, 2, 17),
                     rawIcon(0, 0, 0), rawIcon(0x40000001, 1, 4), rawIcon(65536, 65537, 0x40000),
                     plist::Dictionary{}, rawIcon(32, 32, 4096)});
    ASSERT_TRUE(image);
    EXPECT_EQ(image->size(), (KXSize{32, 32}));
    ASSERT_EQ(image->representations().size(), 2U);
    EXPECT_EQ(image->representations()[0]->pixelSize(), (KXSize{16, 16}));
    EXPECT_EQ(pixelOf(image, 0, 15), qRgba(0x30, 0x20, 0x10, 0xFF));
    EXPECT_EQ(ScratchHome::logged("\n"), 7) << ScratchHome::log();
    for (const char* text :
         {"+[NSImage(KXAppKitAdditions) imageWithRawIcons:]: unknown icon format 'BGRA'\n",
          "icon has invalid size 15 for width=2, height=2\n", "unknown icon format '(null)'\n"})
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
    bool isSmaller = false;
    EXPECT_FALSE(KXImage().bestImageRepForSize({8, 8}, &isSmaller));
    EXPECT_TRUE(isSmaller);
    EXPECT_FALSE(imageOf({{8, 8}})->bestImageRepForSize({0, 8}, &isSmaller));
    EXPECT_TRUE(isSmaller) << "left as it was";
}

TEST(Image, PicksByPointsInOrder) {
    const auto sizeFor = [](std::initializer_list<KXSize> reps, KXSize wanted) {
        return imageOf(reps)->imageRepForSize(wanted)->size().width;
    };
    EXPECT_EQ(sizeFor({{16, 16}, {64, 64}, {48, 48}}, {32, 32}), 16) << "a first one that is too small stays";
    EXPECT_EQ(sizeFor({{128, 128}, {48, 48}, {64, 64}}, {32, 32}), 48);
    EXPECT_EQ(sizeFor({{128, 128}, {16, 64}}, {32, 32}), 16) << "areas count, not shapes";
    EXPECT_FALSE(KXImage().imageRepForSize({1, 1}));
}

TEST(Image, ScalesToWholePixels) {
    const auto image = imageOf({{64, 32}});
    constexpr auto high = KXImageInterpolation::high;
    const auto kept = image->imageByScalingToSize({31.2f, 31.9f}, true, high);
    ASSERT_TRUE(kept);
    EXPECT_EQ(kept->size(), (KXSize{32, 32}));
    for (const auto& [y, alpha] : {std::pair{7, 0}, {8, 255}, {23, 255}, {24, 0}})
        EXPECT_EQ(qAlpha(pixelOf(kept, 16, y)), alpha) << y;
    EXPECT_EQ(qAlpha(pixelOf(image->imageByScalingToSize({32, 32}, false, high), 16, 0)), 255);
    const ScratchHome home;
    EXPECT_FALSE(image->imageByScalingToSize({0, 5}, true, high));
    EXPECT_FALSE(KXImage().imageByScalingToSize({5, 5}, true, high));
    EXPECT_FALSE(image->imageByScalingToSize({4e9f, 5}, true, high));
    for (const char* text : {"interpolation:]: Invalid size for image creation: {0, 5}\n",
                             "interpolation:]: Can't find image representation for size {5, 5}.\n"})
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
    KXImage image({4, 4});
    image.addRepresentation(filled(4, 4));
    QImage pixels = image.bitmapImageRep()->imageView();
    QPainter(&pixels).fillRect(0, 2, 4, 2, Qt::green); // the lower half
    QImage canvas(6, 2, QImage::Format_ARGB32_Premultiplied);
    canvas.fill(Qt::white);
    QPainter painter(&canvas);
    image.drawInRect(painter, {0, 0, 2, 2}, {}, KXCompositingOperation::sourceOver, 1);
    image.drawInRect(painter, {2, 0, 2, 2}, {0, 0, 4, 2}, KXCompositingOperation::sourceOver, 1);
    image.setFlipped(true);
    image.drawInRect(painter, {4, 0, 2, 2}, {0, 0, 4, 2}, KXCompositingOperation::sourceOver, 0.5f);
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
    const auto half = square(4, QColor(0, 0, 255, 128));
    EXPECT_NEAR(qBlue(pixelOf(image->imageByApplyingOverlay(*half), 1, 1)), 128, 1);
    EXPECT_EQ(qAlpha(pixelOf(half->selectedImage(), 1, 1)), 128) << "only what is opaque grows darker";
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

/// The icon of a document, and of a warning in two sizes with too few bytes for the second.
struct Icons : platform::FileTypeIcons {
    int asked = 0;
    Icons() { KXFileTypeIcons::setSource(this); }
    ~Icons() override { KXFileTypeIcons::setSource(nullptr); }
    std::vector<platform::IconPixels> iconForFileType(const std::string& type) override {
        asked += type == "'docu'";
        const std::vector<std::uint8_t> white(std::size_t{256} * 256 * 4, 255);
        const std::uint8_t green[] = {0, 9, 0, 255};
        if (type == "'docu'") return {{256, 256, SharedBytes::copyOf(white.data(), white.size())}};
        if (type != "'caut'") return {};
        return {{1, 1, SharedBytes::copyOf(green, 4)}, {2, 2, SharedBytes::copyOf(green, 4)}};
    }
};

/// Element type to payload; fails the test when the sizes do not add up.
std::map<std::string, SharedBytes> elementsOf(const SharedBytes& family) {
    std::map<std::string, SharedBytes> elements;
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(family.data()), 4), "icns");
    EXPECT_EQ(qFromBigEndian<quint32>(family.data() + 4), family.size());
    for (std::size_t at = 8; at < family.size();) {
        const std::size_t size = qFromBigEndian<quint32>(family.data() + at + 4);
        elements[std::string(reinterpret_cast<const char*>(family.data() + at), 4)] =
            family.slice(at + 8, size - 8);
        at += size;
    }
    return elements;
}

TEST(IconFamily, HoldsTheSizesThatTheImageAllows) {
    const auto elements = elementsOf(square(128, QColor(255, 0, 0, 128))->icnsData());
    const std::map<std::string, std::size_t> sizes{{"ic04", 16}, {"ic05", 32}, {"ic06", 48}, {"ic07", 128}};
    EXPECT_EQ(elements.size(), sizes.size());
    for (const auto& [type, side] : sizes) {
        const SharedBytes& payload = elements.at(type);
        ASSERT_EQ(payload.size(), side * side * 4) << type;
        const std::size_t middle = (side / 2 * side + side / 2) * 4;
        EXPECT_EQ(qFromBigEndian<quint32>(payload.data() + middle) >> 16, 0x80FFU)
            << type << ": straight alpha, red";
    }
    EXPECT_TRUE(KXImage().icnsData().empty());
}

TEST(IconFamily, FramesWhatHasToGrow) {
    const auto elements = elementsOf(square(16)->icnsData());
    const std::byte* const middle = elements.at("ic07").data() + std::ptrdiff_t{64} * 128 * 4;
    EXPECT_EQ(middle[0], std::byte{0}) << "the transparent frame is 7 pixels wide";
    EXPECT_GT(middle[80], std::byte{245});
}

TEST(IconFamily, BadgesTheDocumentIcon) {
    Icons icons;
    const auto badged = square(64)->imageByBadgingOntoGenericDocumentIcon();
    ASSERT_TRUE(badged);
    EXPECT_EQ(badged->size(), (KXSize{128, 128}))
        << "at 256 the badge would have to grow, which is not allowed";
    EXPECT_EQ(badged->representations().size(), 4U);
    const auto smallest = std::static_pointer_cast<KXBitmapImageRep>(badged->representations()[0]);
    EXPECT_EQ(smallest->bitmapFormat(), 3U);
    const QImage picture = smallest->premultipliedImage();
    for (int y = 0; y < 16; ++y)
        for (int x = 0; x < 16; ++x)
            EXPECT_EQ(picture.pixelColor(x, y), QRect(4, 5, 8, 8).contains(x, y) ? Qt::red : Qt::white)
                << x << ", " << y;
    EXPECT_TRUE(square(8)->imageByBadgingOntoGenericDocumentIcon());
    EXPECT_EQ(icons.asked, 1) << "the template is drawn once";
    EXPECT_FALSE(KXImage().imageByBadgingOntoGenericDocumentIcon());
}

TEST(IconFamily, BadgesWithAWarning) {
    EXPECT_FALSE(KXImage::warningIcon()) << "no source";
    const Icons icons;
    ASSERT_TRUE(KXImage::warningIcon());
    EXPECT_EQ(KXImage::warningIcon()->representations().size(), 1U) << "too few bytes for the second";
    const auto image = square(4);
    for (const auto& [type, color] : {std::pair{"caut", qRgb(0, 9, 0)}, {"none", qRgb(255, 0, 0)}})
        EXPECT_EQ(pixelOf(image->addBadgeWithType(type), 2, 2), color) << type;
}

} // namespace
