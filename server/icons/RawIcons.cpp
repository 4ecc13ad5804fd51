#include "server/icons/RawIcons.h"

#include "lib/plist/Value.h"

#include <QImage>
#include <cstddef>
#include <cstring>
#include <memory>
#include <set>
#include <span>
#include <utility>

namespace tessel {
namespace {

plist::Value RawIcon(const QImage& image) {
    // On little-endian machines this format's bytes are blue, green, red, alpha.
    const QImage straight = image.convertToFormat(QImage::Format_ARGB32);
    const auto rowBytes = static_cast<std::size_t>(straight.width()) * 4;
    const auto rows = static_cast<std::size_t>(straight.height());
    auto pixels = std::make_shared<std::byte[]>(rowBytes * rows);
    for (std::size_t row = 0; row < rows; ++row)
        std::memcpy(pixels.get() + row * rowBytes, straight.constScanLine(static_cast<int>(rows - 1 - row)),
                    rowBytes);
    return plist::Dictionary{
        {"format", "bgra"},
        {"width", straight.width()},
        {"height", straight.height()},
        {"data", plist::Data({pixels.get(), rowBytes * rows}, pixels)},
    };
}

} // namespace

plist::Value RawIconSet(std::span<const QImage> images) {
    plist::Array set;
    std::set<std::pair<int, int>> sizes;
    for (const QImage& image : images)
        if (!image.isNull() && sizes.insert({image.width(), image.height()}).second)
            set.push_back(RawIcon(image));
    if (set.empty()) return nullptr;
    return set;
}

} // namespace tessel
