#include "server/icons/IconFolder.h"

#include "lib/base/Log.h"
#include "lib/plist/Value.h"
#include "server/icons/RawIcons.h"

#include <QFile>
#include <QImage>
#include <QPainter>
#include <QSvgRenderer>
#include <array>
#include <cstddef>
#include <string>

namespace tessel {
namespace {

constexpr qint64 maxFileBytes = qint64{256} << 10;
constexpr const char* nameCharacters = "abcdefghijklmnopqrstuvwxyz0123456789-";

QImage Draw(QSvgRenderer& renderer, int size) {
    QImage image(size, size, QImage::Format_ARGB32_Premultiplied);
    image.fill(Qt::transparent);
    QPainter painter(&image);
    renderer.setAspectRatioMode(Qt::KeepAspectRatio);
    renderer.render(&painter, QRectF(0, 0, size, size));
    return image;
}

} // namespace

plist::Value IconFolder::read(const std::string& name) const {
    const char* fault = nullptr;
    QFile file(QString::fromStdString(m_path + "/" + name + ".svg"));
    QSvgRenderer renderer;
    if (name.find_first_not_of(nameCharacters) != name.npos)
        fault = "the name is not allowed";
    else if (!file.open(QIODevice::ReadOnly))
        return nullptr;
    else if (file.size() > maxFileBytes)
        fault = "the file is too large";
    else if (!renderer.load(file.read(maxFileBytes)))
        fault = "it is no picture";
    if (fault) {
        Log("Icon \"%s\": %s\n", name.c_str(), fault);
        return nullptr;
    }
    std::array<QImage, iconSizes.size()> images;
    for (std::size_t i = 0; i < images.size(); ++i)
        images[i] = Draw(renderer, iconSizes[i]);
    return RawIconSet(images);
}

} // namespace tessel
