#include "lib/kxAppKit/KXFileTypeIcons.h"

#include "lib/kxAppKit/KXBitmapImageRep.h"
#include "lib/kxAppKit/KXImage.h"
#include "lib/kxAppKit/KXImageRep.h"
#include "lib/raster/rasterops.h"
#include "platform/FileTypeIcons.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <utility>
#include <vector>

namespace KXFileTypeIcons {

namespace {

platform::FileTypeIcons*& fileTypeIcons() {
    // NOLINTNEXTLINE(cppcoreguidelines-avoid-non-const-global-variables): the one source of the process
    static platform::FileTypeIcons* source = nullptr;
    return source;
}

KXImageRep::Pointer bitmapOf(const platform::IconPixels& icon) {
    const std::size_t rowLength = static_cast<std::size_t>(icon.width) * 4;
    auto bitmap = KXBitmapImageRep::imageRepWith32bitBuffer(nullptr, icon.width, icon.height, 0, 0);
    if (!bitmap || icon.rgba.size() < rowLength * static_cast<std::size_t>(icon.height)) return nullptr;
    const auto* const pixels = reinterpret_cast<const std::uint8_t*>(icon.rgba.data());
    Raster_CopyBlock({bitmap->bitmapData(), bitmap->bytesPerRow()},
                     {pixels, static_cast<std::ptrdiff_t>(rowLength)}, 4,
                     RasterRect::fromSize(0, 0, icon.width, icon.height), 0, 0);
    return bitmap;
}

} // namespace

void setSource(platform::FileTypeIcons* source) {
    fileTypeIcons() = source;
}

KXImage::Pointer iconForFileType(const std::string& type) {
    if (!fileTypeIcons()) return nullptr;
    std::vector<KXImageRep::Pointer> reps;
    for (const platform::IconPixels& icon : fileTypeIcons()->iconForFileType(type))
        if (auto bitmap = bitmapOf(icon)) reps.push_back(std::move(bitmap));
    return KXImage::imageWithRepresentations(reps);
}

std::string fileTypeForHFSTypeCode(const std::string& code) {
    return "'" + code + "'";
}

} // namespace KXFileTypeIcons
