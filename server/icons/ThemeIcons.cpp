#include "server/icons/ThemeIcons.h"

#include "lib/base/Log.h"
#include "lib/plist/Value.h"
#include "server/icons/RawIcons.h"

#include <QFileInfo>
#include <QIcon>
#include <QImage>
#include <QImageReader>
#include <QPixmap>
#include <array>
#include <cstddef>
#include <string>
#include <vector>

namespace tessel {
namespace {

constexpr qint64 maxFileBytes = qint64{4} << 20;
constexpr int maxFileSide = 4096;

QStringList List(const std::vector<std::string>& texts) {
    QStringList list;
    for (const std::string& text : texts)
        list << QString::fromStdString(text);
    return list;
}

/// Whether the file may be decoded. What a file claims of its size is read before anything is allocated for
/// it.
bool IsWithinBounds(const QString& path) {
    const QSize size = QImageReader(path).size();
    if (QFileInfo(path).size() <= maxFileBytes && size.width() <= maxFileSide && size.height() <= maxFileSide)
        return true;
    Log("Icon \"%s\": the file is too large\n", path.toUtf8().constData());
    return false;
}

} // namespace

void ThemeIcons::look(const Places& places) {
    QIcon::setFallbackSearchPaths(List(places.looseFolders));
    QIcon::setThemeName(QString::fromStdString(places.theme));
    QIcon::setFallbackThemeName(QString::fromStdString(places.fallbackTheme));
    QIcon::setThemeSearchPaths(List(places.themeFolders)); // forgets what was found before
}

plist::Value ThemeIcons::read(const std::string& name) const {
    const QString text = QString::fromStdString(name);
    const bool isFile = text.startsWith('/');
    if (isFile && (!QFileInfo(text).isFile() || !IsWithinBounds(text))) return nullptr;
    const QIcon icon = isFile ? QIcon(text) : QIcon::fromTheme(text);
    std::array<QImage, iconSizes.size()> images;
    for (std::size_t i = 0; i < images.size(); ++i)
        images[i] = icon.pixmap(QSize(iconSizes[i], iconSizes[i]), 1.0).toImage();
    return RawIconSet(images);
}

} // namespace tessel
