#include "lib/base/Geometry.h"
#include "lib/base/Log.h"
#include "lib/base/SharedBytes.h"
#include "lib/kxAppKit/KXBitmapImageRep.h"
#include "lib/kxAppKit/KXFileTypeIcons.h"
#include "lib/kxAppKit/KXGeometry.h"
#include "lib/kxAppKit/KXImage.h"
#include "lib/kxAppKit/KXImageRep.h"
#include "lib/kxAppKit/KXTiff.h"

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

namespace {

constexpr KXBitmapFormat straightARGB = KXAlphaFirstBitmapFormat | KXAlphaNonpremultipliedBitmapFormat;

struct FamilyMember {
    std::uint32_t size;
    bool mayUpscale;
    std::uint32_t badgeSize;
    std::uint32_t badgeX;
    std::uint32_t badgeY;
    const char* elementType;
    KXBitmapImageRep::Pointer documentTemplate = nullptr; ///< drawn once, kept for the life of the process

    KXSize pixels() const { return {static_cast<float>(size), static_cast<float>(size)}; }
    KXSize badgePixels() const { return {static_cast<float>(badgeSize), static_cast<float>(badgeSize)}; }
};

std::vector<FamilyMember>& iconFamily() {
    static std::vector<FamilyMember> family{
        {16, true, 8, 4, 3, "ic04"},       {32, true, 16, 8, 7, "ic05"},
        {48, true, 24, 12, 11, "ic06"},    {128, true, 64, 32, 32, "ic07"},
        {256, false, 128, 64, 64, "ic08"}, {512, false, 256, 128, 128, "ic09"},
    };
    return family;
}

KXRect wholeOf(KXSize size) {
    return {0, 0, size.width, size.height};
}

KXBitmapImageRep::Pointer clearedBitmap(KXSize size, KXBitmapFormat format, std::int32_t bytesPerRow = 0) {
    return KXBitmapImageRep::imageRepWith32bitBuffer(nullptr, KXPixelCount(size.width),
                                                     KXPixelCount(size.height), format, bytesPerRow);
}

/// With a transparent frame of one pixel, which keeps an enlargement from smearing the edges; itself when
/// that fails.
KXImageRep::Pointer padded(const KXImageRep::Pointer& source) {
    const KXSize size = source->pixelSize();
    const auto frame = clearedBitmap({size.width + 2, size.height + 2}, 0);
    const KXRect inside{1, 1, size.width, size.height};
    if (!frame || !source->drawIntoBitmapRep(*frame, inside, KXImageInterpolation::none)) return source;
    return frame;
}

/// What a member of the family is drawn from, padded if it has to grow; null when the image has nothing fit
/// for it.
KXImageRep::Pointer sourceFor(const KXImage& image, KXSize size, bool mayUpscale) {
    bool isSmaller = false;
    const KXImageRep::Pointer source = image.bestImageRepForSize(size, &isSmaller);
    if (!source || (isSmaller && !mayUpscale)) return nullptr;
    const bool isBitmap = dynamic_cast<const KXBitmapImageRep*>(source.get()) != nullptr;
    return isSmaller && isBitmap ? padded(source) : source;
}

/// A padded source has the aspect that its frame gives it.
bool drawFitting(const KXImageRep& source, KXBitmapImageRep& target, KXSize size) {
    return source.drawIntoBitmapRep(target,
                                    KXRectFittingAspect(wholeOf(size), KXSizeAspectRatio(source.pixelSize())),
                                    KXImageInterpolation::high);
}

KXBitmapImageRep::Pointer copyOfTemplate(const FamilyMember& member) {
    const KXBitmapImageRep& original = *member.documentTemplate;
    auto copy = clearedBitmap(original.pixelSize(), original.bitmapFormat(), original.bytesPerRow());
    if (copy && original.drawIntoBitmapRep(*copy, wholeOf(original.pixelSize()), KXImageInterpolation::none))
        return copy;
    Log("Could not copy document icon template for size %u\n", member.size);
    return nullptr;
}

KXBitmapImageRep::Pointer badgedDocument(const KXImage& image, const FamilyMember& member) {
    const KXImageRep::Pointer source = sourceFor(image, member.badgePixels(), member.mayUpscale);
    if (!source) return nullptr;
    auto document = copyOfTemplate(member);
    if (!document) return nullptr;
    const auto* bitmap = dynamic_cast<const KXBitmapImageRep*>(source.get());
    const auto badge = clearedBitmap(member.badgePixels(), bitmap ? bitmap->bitmapFormat() : 0);
    if (!badge || !drawFitting(*source, *badge, member.badgePixels())) {
        Log("Could not draw app icon badge for size %u\n", member.size);
        return nullptr;
    }
    const KXPoint place{static_cast<float>(member.badgeX), static_cast<float>(member.badgeY)};
    if (badge->multiplyPixelDataIntoBitmapRep(*document, place)) return document;
    Log("Could not draw app icon badge on the document template for size %u\n", member.size);
    return nullptr;
}

void append(std::vector<std::uint8_t>& to, const char* type, std::uint32_t length) {
    to.insert(to.end(), type, type + 4);
    for (int shift = 24; shift >= 0; shift -= 8)
        to.push_back(static_cast<std::uint8_t>(length >> shift));
}

} // namespace

void KXImage::initializeDocumentIconTemplate() {
    static bool done = false;
    if (std::exchange(done, true)) return;
    const Pointer icon = KXFileTypeIcons::iconForFileType(KXFileTypeIcons::fileTypeForHFSTypeCode("docu"));
    if (!icon) return;
    for (FamilyMember& member : iconFamily()) {
        bool isSmaller = false;
        const KXImageRep::Pointer rep = icon->bestImageRepForSize(member.pixels(), &isSmaller);
        if (!rep || isSmaller) continue;
        auto bitmap = clearedBitmap(member.pixels(), straightARGB);
        if (bitmap && rep->drawIntoBitmapRep(*bitmap, wholeOf(member.pixels()), KXImageInterpolation::high))
            member.documentTemplate = std::move(bitmap);
    }
}

KXImage::Pointer KXImage::imageByBadgingOntoGenericDocumentIcon() const {
    initializeDocumentIconTemplate();
    std::vector<KXImageRep::Pointer> documents;
    for (const FamilyMember& member : iconFamily()) {
        if (!member.documentTemplate) continue;
        if (auto document = badgedDocument(*this, member)) documents.push_back(std::move(document));
    }
    return imageWithRepresentations(documents);
}

SharedBytes KXImage::icnsData() const {
    constexpr std::uint32_t headerSize = 8;
    std::vector<std::uint8_t> elements;
    for (const FamilyMember& member : iconFamily()) {
        const KXImageRep::Pointer source = sourceFor(*this, member.pixels(), member.mayUpscale);
        if (!source) continue;
        std::vector<std::uint8_t> pixels(std::size_t{member.size} * member.size * 4);
        const auto side = static_cast<std::int32_t>(member.size);
        const auto bitmap =
            KXBitmapImageRep::imageRepWith32bitBuffer(pixels.data(), side, side, straightARGB, side * 4);
        if (!bitmap || !drawFitting(*source, *bitmap, member.pixels())) {
            Log("Could not draw icon for size %u\n", member.size);
            continue;
        }
        // Every type's pixels are raw, though readers may know some of them packed.
        append(elements, member.elementType, headerSize + static_cast<std::uint32_t>(pixels.size()));
        elements.insert(elements.end(), pixels.begin(), pixels.end());
    }
    if (elements.empty()) return {};
    std::vector<std::uint8_t> family;
    append(family, "icns", headerSize + static_cast<std::uint32_t>(elements.size()));
    family.insert(family.end(), elements.begin(), elements.end());
    return SharedBytes::copyOf(family.data(), family.size());
}

SharedBytes KXImage::TIFFRepresentation() const {
    std::vector<KXBitmapImageRep::Pointer> drawn;
    std::vector<const KXBitmapImageRep*> pictures;
    for (const KXImageRep::Pointer& rep : m_representations) {
        if (const auto* bitmap = dynamic_cast<const KXBitmapImageRep*>(rep.get())) {
            pictures.push_back(bitmap);
            continue;
        }
        const KXSize size{std::ceil(rep->pixelSize().width), std::ceil(rep->pixelSize().height)};
        const auto bitmap = clearedBitmap(size, 0);
        if (!bitmap || !rep->drawIntoBitmapRep(*bitmap, wholeOf(size), KXImageInterpolation::high)) continue;
        drawn.push_back(bitmap);
        pictures.push_back(bitmap.get());
    }
    return pictures.empty() ? SharedBytes() : KXTiff::write(pictures);
}
