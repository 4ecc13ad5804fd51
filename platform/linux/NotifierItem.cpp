#include "platform/linux/NotifierItem.h"

#include <QDBusMetaType>
#include <QtEndian>
#include <functional>
#include <utility>

namespace platform {

QDBusArgument& operator<<(QDBusArgument& argument, const NotifierPixmap& pixmap) {
    argument.beginStructure();
    argument << pixmap.width << pixmap.height << pixmap.pixels;
    argument.endStructure();
    return argument;
}

const QDBusArgument& operator>>(const QDBusArgument& argument, NotifierPixmap& pixmap) {
    argument.beginStructure();
    argument >> pixmap.width >> pixmap.height >> pixmap.pixels;
    argument.endStructure();
    return argument;
}

QDBusArgument& operator<<(QDBusArgument& argument, const NotifierToolTip& toolTip) {
    argument.beginStructure();
    argument << toolTip.iconName << toolTip.iconPixmap << toolTip.title << toolTip.text;
    argument.endStructure();
    return argument;
}

const QDBusArgument& operator>>(const QDBusArgument& argument, NotifierToolTip& toolTip) {
    argument.beginStructure();
    argument >> toolTip.iconName >> toolTip.iconPixmap >> toolTip.title >> toolTip.text;
    argument.endStructure();
    return argument;
}

NotifierPixmap NotifierPixmapFromImage(const QImage& image) {
    const QImage argb = image.convertToFormat(QImage::Format_ARGB32);
    NotifierPixmap pixmap{argb.width(), argb.height(), QByteArray(argb.sizeInBytes(), Qt::Uninitialized)};
    qToBigEndian<quint32>(argb.constBits(), argb.sizeInBytes() / qsizetype{sizeof(quint32)},
                          pixmap.pixels.data());
    return pixmap;
}

NotifierItem::NotifierItem(QString identifier, QString title, std::function<void(Click, QPoint)> clicked)
    : m_id(std::move(identifier))
    , m_title(std::move(title))
    , m_clicked(std::move(clicked)) {
    qDBusRegisterMetaType<NotifierPixmap>();
    qDBusRegisterMetaType<NotifierPixmaps>();
    qDBusRegisterMetaType<NotifierToolTip>();
}

void NotifierItem::setIconPixmap(NotifierPixmaps pixmaps) {
    if (pixmaps == m_iconPixmap) return;
    m_iconPixmap = std::move(pixmaps);
    Q_EMIT NewIcon();
}

} // namespace platform
