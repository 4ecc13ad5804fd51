#pragma once

#include <QByteArray>
#include <QDBusArgument>
#include <QImage>
#include <QList>
#include <QObject>
#include <QPoint>
#include <QString>
#include <functional>

namespace platform {

/// A picture as the protocol has it: 32-bit ARGB, most significant byte first.
struct NotifierPixmap {
    int width = 0;
    int height = 0;
    QByteArray pixels;
    friend bool operator==(const NotifierPixmap&, const NotifierPixmap&) = default;
};
using NotifierPixmaps = QList<NotifierPixmap>;

struct NotifierToolTip {
    QString iconName;
    NotifierPixmaps iconPixmap;
    QString title;
    QString text;
};

QDBusArgument& operator<<(QDBusArgument& argument, const NotifierPixmap& pixmap);
const QDBusArgument& operator>>(const QDBusArgument& argument, NotifierPixmap& pixmap);
QDBusArgument& operator<<(QDBusArgument& argument, const NotifierToolTip& toolTip);
const QDBusArgument& operator>>(const QDBusArgument& argument, NotifierToolTip& toolTip);

NotifierPixmap NotifierPixmapFromImage(const QImage& image);

/// A status notifier item as it stands on the bus. It has no property "Menu": hosts that find one, even an
/// empty one, ask for a menu over the bus at a right click, and the click is lost.
class NotifierItem final : public QObject {
    Q_OBJECT
    Q_CLASSINFO("D-Bus Interface", "org.kde.StatusNotifierItem")
    Q_PROPERTY(QString Category MEMBER m_category CONSTANT)
    Q_PROPERTY(QString Id MEMBER m_id CONSTANT)
    Q_PROPERTY(QString Title MEMBER m_title CONSTANT)
    Q_PROPERTY(QString Status MEMBER m_status CONSTANT)
    Q_PROPERTY(int WindowId MEMBER m_windowId CONSTANT)
    Q_PROPERTY(QString IconName MEMBER m_iconName CONSTANT)
    Q_PROPERTY(platform::NotifierPixmaps IconPixmap READ iconPixmap)
    Q_PROPERTY(platform::NotifierToolTip ToolTip READ toolTip)
    Q_PROPERTY(bool ItemIsMenu MEMBER m_itemIsMenu CONSTANT)

public:
    enum class Click { main, context };

    NotifierItem(QString identifier, QString title, std::function<void(Click, QPoint)> clicked);

    NotifierPixmaps iconPixmap() const { return m_iconPixmap; }
    void setIconPixmap(NotifierPixmaps pixmaps); ///< tells the host when they are others
    NotifierToolTip toolTip() const { return {{}, {}, m_title, {}}; }

    // NOLINTBEGIN(readability-identifier-naming): the protocol's names
public Q_SLOTS:
    void Activate(int x, int y) { m_clicked(Click::main, {x, y}); }
    void SecondaryActivate(int x, int y) { m_clicked(Click::main, {x, y}); }
    void ContextMenu(int x, int y) { m_clicked(Click::context, {x, y}); }
    void Scroll(int /*delta*/, const QString& /*orientation*/) {}

Q_SIGNALS:
    void NewIcon();
    // NOLINTEND(readability-identifier-naming)

private:
    QString m_category = QStringLiteral("ApplicationStatus");
    QString m_id;
    QString m_title;
    QString m_status = QStringLiteral("Active");
    QString m_iconName;
    NotifierPixmaps m_iconPixmap;
    int m_windowId = 0;
    bool m_itemIsMenu = false;
    std::function<void(Click, QPoint)> m_clicked;
};

} // namespace platform
