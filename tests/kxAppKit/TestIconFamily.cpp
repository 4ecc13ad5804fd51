#include "lib/kxAppKit/KXBitmapImageRep.h"
#include "lib/kxAppKit/KXFileTypeIcons.h"
#include "lib/kxAppKit/KXImage.h"
#include "platform/FileTypeIcons.h"

#include <QImage>
#include <gtest/gtest.h>
#include <map>

namespace {

KXImage::Pointer square(int side, QColor color, KXBitmapFormat format = 0) {
    auto rep = KXBitmapImageRep::imageRepWith32bitBuffer(nullptr, side, side, 0, 0);
    rep->imageView().fill(color);
    auto target = KXBitmapImageRep::imageRepWith32bitBuffer(nullptr, side, side, format, 0);
    const auto length = static_cast<float>(side);
    rep->drawIntoBitmapRep(*target, {0, 0, length, length}, KXImageInterpolation::none);
    return KXImage::imageWithRepresentations({target});
}

std::uint32_t bigEndian(const std::byte* p) {
    std::uint32_t value = 0;
    for (int i = 0; i < 4; ++i)
        value = value << 8 | std::to_integer<std::uint32_t>(p[i]);
    return value;
}

/// Element type to payload; fails the test when the sizes do not add up.
std::map<std::string, SharedBytes> elementsOf(const SharedBytes& family) {
    std::map<std::string, SharedBytes> elements;
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(family.data()), 4), "icns");
    EXPECT_EQ(bigEndian(family.data() + 4), family.size());
    for (std::size_t at = 8; at < family.size();) {
        const std::size_t size = bigEndian(family.data() + at + 4);
        elements[std::string(reinterpret_cast<const char*>(family.data() + at), 4)] =
            family.slice(at + 8, size - 8);
        at += size;
    }
    return elements;
}

TEST(IconFamily, HoldsTheSizesThatTheImageAllows) {
    const auto elements = elementsOf(square(128, QColor(255, 0, 0, 128), 3)->icnsData());
    std::vector<std::string> types;
    for (const auto& [type, payload] : elements)
        types.push_back(type);
    EXPECT_EQ(types, (std::vector<std::string>{"ic04", "ic05", "ic06", "ic07"}));
    const std::map<std::string, std::size_t> sizes{{"ic04", 16}, {"ic05", 32}, {"ic06", 48}, {"ic07", 128}};
    for (const auto& [type, side] : sizes) {
        const SharedBytes& payload = elements.at(type);
        ASSERT_EQ(payload.size(), side * side * 4) << type;
        const std::size_t middle = (side / 2 * side + side / 2) * 4;
        EXPECT_EQ(bigEndian(payload.data() + middle) >> 16, 0x80FFU) << type << ": straight alpha, red";
    }
    EXPECT_TRUE(KXImage().icnsData().empty());
}

TEST(IconFamily, FramesWhatHasToGrow) {
    const auto elements = elementsOf(square(16, Qt::red)->icnsData());
    EXPECT_EQ(elements.size(), 4U);
    const SharedBytes& grown = elements.at("ic07");
    const auto alphaAt = [&](std::size_t x) {
        return std::to_integer<int>(grown.data()[(64 * 128 + x) * 4]);
    };
    EXPECT_EQ(alphaAt(0), 0) << "the transparent frame is 7 pixels wide";
    EXPECT_GT(alphaAt(20), 245);
}

TEST(IconFamily, BadgesTheDocumentIcon) {
    struct Documents : platform::FileTypeIcons {
        int asked = 0;
        std::vector<platform::IconPixels> iconForFileType(const std::string& type) override {
            asked += type == "'docu'";
            const std::vector<std::uint8_t> white(std::size_t{256} * 256 * 4, 255);
            return {{256, 256, SharedBytes::copyOf(white.data(), white.size())}};
        }
    } documents;
    KXFileTypeIcons::setSource(&documents);
    const auto badged = square(64, Qt::red)->imageByBadgingOntoGenericDocumentIcon();
    ASSERT_TRUE(badged);
    EXPECT_EQ(badged->size(), (KXSize{128, 128}))
        << "at 256 the badge would have to grow, which is not allowed";
    EXPECT_EQ(badged->representations().size(), 4U);
    const auto smallest = std::static_pointer_cast<KXBitmapImageRep>(badged->representations()[0]);
    EXPECT_EQ(smallest->bitmapFormat(), 3U);
    const QImage picture = smallest->premultipliedImage();
    for (int y = 0; y < 16; ++y)
        for (int x = 0; x < 16; ++x) {
            const bool covered = x >= 4 && x < 12 && y >= 5 && y < 13;
            EXPECT_EQ(picture.pixel(x, y), covered ? qRgb(255, 0, 0) : qRgb(255, 255, 255)) << x << ", " << y;
        }
    EXPECT_TRUE(square(8, Qt::red)->imageByBadgingOntoGenericDocumentIcon());
    EXPECT_EQ(documents.asked, 1) << "the template is drawn once";
    EXPECT_FALSE(KXImage().imageByBadgingOntoGenericDocumentIcon());
    KXFileTypeIcons::setSource(nullptr);
}

} // namespace
