#include "platform/linux/NotifierStatusBar.h"

#include "lib/base/Geometry.h"
#include "lib/base/Log.h"
#include "platform/StatusBar.h"
#include "platform/linux/NotifierHost.h"
#include "platform/linux/NotifierItem.h"
#include "platform/linux/PanelPlacement.h"
#include "platform/linux/QtScreenCoordinates.h"

#include <QCoreApplication>
#include <QCursor>
#include <QDBusConnection>
#include <QDBusMessage>
#include <QDBusPendingCallWatcher>
#include <QDBusPendingReply>
#include <QPainter>
#include <memory>
#include <optional>
#include <utility>

namespace platform {

namespace {

constexpr int pixmapSizes[] = {16, 22, 24, 32, 44, 48, 64};

/// The view in a square as high as the bar is thick, enlarged or shrunk as a whole.
QImage drawn(StatusItemView& view, float thickness, int size) {
    QImage image(size, size, QImage::Format_ARGB32_Premultiplied);
    image.fill(Qt::transparent);
    QPainter painter(&image);
    painter.setRenderHints(QPainter::Antialiasing | QPainter::SmoothPixmapTransform);
    const double scale = size / double{thickness};
    painter.scale(scale, scale);
    view.draw(painter, {thickness, thickness});
    return image;
}

/// On a connection to the bus of its own: an item is named by its connection, and ends with it for every
/// host.
class NotifierStatusItem final : public StatusItem {
public:
    NotifierStatusItem(KXSize size, StatusItemView& view)
        : m_size(size)
        , m_view(view)
        , m_item(QCoreApplication::applicationName(), QString::fromStdString(view.toolTip()),
                 [this](NotifierItem::Click click, QPoint at) { clicked(click, at); }) {
        setNeedsDisplay();
        m_bus.registerObject(QStringLiteral("/StatusNotifierItem"), &m_item,
                             QDBusConnection::ExportAllContents);
        m_bus.registerService(m_name);
        announce();
    }
    ~NotifierStatusItem() override { QDBusConnection::disconnectFromBus(m_name); }
    NotifierStatusItem(const NotifierStatusItem&) = delete;
    NotifierStatusItem& operator=(const NotifierStatusItem&) = delete;

    void setNeedsDisplay() override {
        NotifierPixmaps pixmaps;
        for (const int size : pixmapSizes)
            pixmaps.append(NotifierPixmapFromImage(drawn(m_view, m_size.height, size)));
        m_item.setIconPixmap(std::move(pixmaps));
    }

    KXRect frame() const override {
        const QScreen* screen = ScreenAt(m_click.value_or(QPoint()));
        if (!m_click) screen = QGuiApplication::primaryScreen();
        if (!screen) return {};
        std::optional<KXPoint> click;
        if (m_click) click = ScreenRectFromQt(QRectF(*m_click, QSizeF())).origin();
        return StatusItemFrameAt(click, m_size, ScreenRectFromQt(screen->geometry()),
                                 ScreenRectFromQt(screen->availableGeometry()));
    }

private:
    static QString nextName() {
        static int count = 0;
        return QStringLiteral("org.kde.StatusNotifierItem-%1-%2")
            .arg(QCoreApplication::applicationPid())
            .arg(++count);
    }

    void announce() {
        auto call = QDBusMessage::createMethodCall(NotifierHost::serviceName(), NotifierHost::path(),
                                                   NotifierHost::serviceName(),
                                                   QStringLiteral("RegisterStatusNotifierItem"));
        call << m_name;
        auto* watcher = new QDBusPendingCallWatcher(m_bus.asyncCall(call), &m_item);
        QObject::connect(watcher, &QDBusPendingCallWatcher::finished, &m_item, [watcher] {
            const QDBusPendingReply<> reply = *watcher;
            if (reply.isError())
                Log("The status bar did not take the item: %s\n", qPrintable(reply.error().message()));
            watcher->deleteLater();
        });
    }

    void clicked(NotifierItem::Click click, QPoint at) {
        // Hosts that do not know the place say 0, 0; only the corner itself is truly there.
        if (!at.isNull() || QCursor::pos().isNull()) m_click = at;
        if (click == NotifierItem::Click::context)
            m_view.rightMouseDown();
        else
            m_view.mouseDown();
    }

    KXSize m_size;
    StatusItemView& m_view;
    std::optional<QPoint> m_click;
    QString m_name = nextName();
    NotifierItem m_item;
    QDBusConnection m_bus = QDBusConnection::connectToBus(QDBusConnection::SessionBus, m_name);
};

} // namespace

NotifierStatusBar::NotifierStatusBar()
    : m_watched([this](bool isPresent) {
        if (!isPresent)
            hostWent();
        else if (host() == 0)
            hostAppeared();
    }) {}

std::unique_ptr<StatusItem> NotifierStatusBar::addItem(float length, StatusItemView& view) {
    return std::make_unique<NotifierStatusItem>(KXSize{length, thickness()}, view);
}

} // namespace platform
