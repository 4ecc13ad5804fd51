#include "platform/linux/ThemeFileTypeIcons.h"

#include "lib/base/SharedBytes.h"
#include "platform/FileTypeIcons.h"

#include <QIcon>
#include <QImage>
#include <QMimeDatabase>
#include <QPixmap>
#include <algorithm>
#include <array>
#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace platform {

namespace {

struct TypeCode {
    std::string_view code;
    const char* iconName;
};

constexpr TypeCode typeCodes[] = {
    {"'caut'", "dialog-warning"},
    {"'stop'", "dialog-error"},
    {"'note'", "dialog-information"},
    {"'docu'", "text-x-generic"},
    {"'APPL'", "application-x-executable"},
    {"'fldr'", "folder"},
    {"'root'", "computer"},
    {"'trsh'", "user-trash"},
};

/// Asked for beyond what a theme lists: a picture that scales is listed under one size only.
constexpr std::array sizesOfScalableIcons = {16, 32, 48, 128, 256};

QIcon iconForType(const std::string& type) {
    const auto* code = std::ranges::find(typeCodes, type, &TypeCode::code);
    if (code != std::end(typeCodes)) return QIcon::fromTheme(QString::fromLatin1(code->iconName));
    const QMimeType mimeType = QMimeDatabase().mimeTypeForFile(
        QStringLiteral("file.") + QString::fromStdString(type), QMimeDatabase::MatchExtension);
    return QIcon::fromTheme(mimeType.iconName(), QIcon::fromTheme(mimeType.genericIconName()));
}

IconPixels pixelsOf(const QImage& picture) {
    const QImage image = picture.convertToFormat(QImage::Format_RGBA8888_Premultiplied);
    // Rows of four-byte pixels stand without gaps.
    return {image.width(), image.height(),
            SharedBytes::copyOf(image.constBits(), static_cast<std::size_t>(image.sizeInBytes()))};
}

} // namespace

ThemeFileTypeIcons::ThemeFileTypeIcons() {
    if (QIcon::fallbackThemeName().isEmpty()) QIcon::setFallbackThemeName(QStringLiteral("Adwaita"));
}

std::vector<IconPixels> ThemeFileTypeIcons::iconForFileType(const std::string& type) {
    const QIcon icon = iconForType(type);
    QList<QSize> sizes = icon.availableSizes();
    std::ranges::sort(sizes, {}, &QSize::width);
    const int largest = sizes.isEmpty() ? 0 : sizes.last().width();
    for (const int side : sizesOfScalableIcons)
        if (side > largest) sizes.append(QSize(side, side));
    std::vector<IconPixels> pictures;
    for (const QSize& size : sizes) {
        const QImage image = icon.pixmap(size, 1.0).toImage();
        const auto isTaken = [&image](const IconPixels& taken) {
            return taken.width == image.width() && taken.height == image.height();
        };
        if (!image.isNull() && std::ranges::none_of(pictures, isTaken)) pictures.push_back(pixelsOf(image));
    }
    return pictures;
}

} // namespace platform
