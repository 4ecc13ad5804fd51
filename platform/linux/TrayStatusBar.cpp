#include "platform/linux/TrayStatusBar.h"

#include "lib/base/Geometry.h"
#include "platform/MainLoop.h"
#include "platform/StatusBar.h"
#include "platform/linux/QtScreenCoordinates.h"
#include "platform/linux/StatusItemWidget.h"
#include "platform/linux/XcbTray.h"

#include <QPainter>
#include <chrono>
#include <cstdint>
#include <memory>

namespace platform {

namespace {

constexpr auto patienceForDocking = std::chrono::milliseconds(600);

bool isXcb(const QByteArray& eventType) {
    return eventType == "xcb_generic_event_t";
}

} // namespace

class TrayWidget final : public StatusItemWidget {
public:
    TrayWidget(StatusItemView& view, bool isTranslucent)
        : StatusItemWidget(view, Qt::X11BypassWindowManagerHint) {
        setAttribute(isTranslucent ? Qt::WA_TranslucentBackground : Qt::WA_OpaquePaintEvent);
    }

    std::uint32_t id() const { return static_cast<std::uint32_t>(winId()); }

protected:
    void paintEvent(QPaintEvent* event) override {
        if (testAttribute(Qt::WA_OpaquePaintEvent)) QPainter(this).drawImage(rect(), XcbTrayBackground(id()));
        StatusItemWidget::paintEvent(event);
    }
};

class TrayStatusBar::Item final : public StatusItem, private QAbstractNativeEventFilter {
public:
    Item(TrayStatusBar& bar, QSize size, StatusItemView& view)
        : m_bar(bar)
        , m_host(bar.host())
        , m_widget(view, XcbTrayIsTranslucent(bar.m_tray)) {
        m_widget.resize(size);
        m_widget.winId();
        m_widget.setMinimumSize(size); // of the native window, where hosts look for the size that we want
        qGuiApp->installNativeEventFilter(this);
        XcbDockInTray(bar.m_tray, m_widget.id());
        m_patience = bar.m_mainLoop.startTimer(patienceForDocking, {}, [this] {
            if (!m_isDocked || XcbIsHiddenByBridge(m_widget.id())) giveUpHost();
        });
    }
    ~Item() override { qGuiApp->removeNativeEventFilter(this); }
    Item(const Item&) = delete;
    Item& operator=(const Item&) = delete;

    void setNeedsDisplay() override { m_widget.update(); }

    KXRect frame() const override {
        const KXRect native = XcbFrameOnDesktop(m_widget.id());
        return ScreenRectFromQt(QtRectFromNative({native.x, native.y, native.width, native.height}));
    }

private:
    bool nativeEventFilter(const QByteArray& eventType, void* message, qintptr*) override {
        if (!isXcb(eventType)) return false;
        const auto event = XcbReadTrayEvent(message);
        if (!event || event->window != m_widget.id()) return false;
        if (event->kind == XcbTrayEvent::Kind::takenIn) takenIn();
        // Thrown out, or its host died: as a window of its own it would stand somewhere on the screen.
        if (event->kind == XcbTrayEvent::Kind::movedOut && m_isDocked) {
            m_widget.hide();
            giveUpHost();
        }
        return false;
    }

    void takenIn() {
        m_isDocked = true;
        if (XcbIsHiddenByBridge(m_widget.id())) {
            giveUpHost();
            return;
        }
        // Not inside of the toolkit's handling of the event.
        QMetaObject::invokeMethod(
            &m_widget, [this] { m_widget.show(); }, Qt::QueuedConnection);
    }

    void giveUpHost() {
        if (m_bar.host() == m_host) m_bar.hostWent();
    }

    TrayStatusBar& m_bar;
    std::uint64_t m_host;
    TrayWidget m_widget;
    bool m_isDocked = false;
    std::unique_ptr<Handle> m_patience;
};

TrayStatusBar::TrayStatusBar(MainLoop& mainLoop)
    : m_mainLoop(mainLoop) {
    qGuiApp->installNativeEventFilter(this);
    lookForTray();
}

TrayStatusBar::~TrayStatusBar() {
    qGuiApp->removeNativeEventFilter(this);
}

std::unique_ptr<StatusItem> TrayStatusBar::addItem(float length, StatusItemView& view) {
    return std::make_unique<Item>(*this, QSizeF(length, thickness()).toSize(), view);
}

bool TrayStatusBar::nativeEventFilter(const QByteArray& eventType, void* message, qintptr*) {
    if (!isXcb(eventType)) return false;
    const auto event = XcbReadTrayEvent(message);
    if (!event) return false;
    const bool isEndOfTray = event->kind == XcbTrayEvent::Kind::destroyed && event->window == m_tray;
    if (isEndOfTray || event->kind == XcbTrayEvent::Kind::newTray) lookForTray();
    return false;
}

void TrayStatusBar::lookForTray() {
    m_tray = XcbFindTray();
    if (m_tray != 0)
        hostAppeared();
    else
        hostWent();
}

} // namespace platform
