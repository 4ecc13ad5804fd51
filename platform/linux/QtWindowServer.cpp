#include "platform/linux/QtWindowServer.h"

#include "lib/base/Geometry.h"
#include "platform/MainLoop.h"
#include "platform/WindowServer.h"
#include "platform/linux/PanelPlacement.h"
#include "platform/linux/QtScreenCoordinates.h"
#include "platform/linux/ReducedMotion.h"
#include "platform/linux/XcbCapture.h"
#include "platform/linux/XcbPanel.h"
#include "platform/linux/XcbServerTime.h"

#include <QAbstractNativeEventFilter>
#include <QApplication>
#include <QCursor>
#include <QImage>
#include <QKeyEvent>
#include <QPixmap>
#include <QWidget>
#include <QWindow>
#include <algorithm>
#include <cstdint>
#include <functional>
#include <memory>
#include <utility>

namespace platform {

namespace {

constexpr unsigned lastRealButton = 3; // the wheel is made of buttons too

/// The toolkit lets only a widget itself give its native window back.
struct NativeWindowOwner : QWidget {
    using QWidget::destroy;
};

class QtPanelWindow final : public PanelWindow, private QObject, private QAbstractNativeEventFilter {
public:
    QtPanelWindow(QWidget& contentView, PanelDelegate& delegate, std::function<KXRect()> ownArea)
        : m_view(contentView)
        , m_delegate(delegate)
        , m_ownArea(std::move(ownArea))
        , m_frame(ScreenRectFromQt(contentView.geometry())) {
        m_view.setWindowFlags(Qt::Window | Qt::FramelessWindowHint | Qt::X11BypassWindowManagerHint);
        m_view.setAttribute(Qt::WA_TranslucentBackground, XcbIsCompositing());
        m_view.installEventFilter(this);
        qGuiApp->installNativeEventFilter(this);
        XcbWatchButtonPresses();
    }
    ~QtPanelWindow() override { qGuiApp->removeNativeEventFilter(this); }
    QtPanelWindow(const QtPanelWindow&) = delete;
    QtPanelWindow& operator=(const QtPanelWindow&) = delete;

    KXRect frame() const override { return m_frame; }

    void setFrame(const KXRect& frame) override {
        m_frame = frame;
        place();
    }

    bool isVisible() const override { return m_view.isVisible(); }

    void makeKeyAndOrderFront() override {
        if (!isVisible()) {
            rememberFocus();
            followCompositor();
            tellOption(); // it may have changed while another window had the keyboard
        }
        place();
        m_view.show();
        m_view.raise();
        m_view.windowHandle()->installEventFilter(this); // once, however often
        takeKeyboard();
    }

    void orderOut() override {
        if (!isVisible()) return;
        m_keyboard.reset();
        if (XcbInputFocus() == nativeWindow()) XcbSetInputFocus(m_focusBefore, m_keySince);
        m_view.hide();
    }

    void addWindowFilter() override {
        m_hasFilter = true;
        XcbBlurBehind(nativeWindow());
    }

    QImage screenBelow() const override {
        QScreen* screen = ScreenAt(m_view.geometry().center());
        if (!screen || XcbIsUnderWayland()) return {};
        // The point past the right edge is not there to be seen.
        const QRect seen = m_view.geometry().intersected(screen->geometry());
        const QPoint corner = seen.topLeft() - screen->geometry().topLeft();
        const double scale = screen->devicePixelRatio();
        const QRectF native(screen->geometry().topLeft() + QPointF(corner) * scale,
                            QSizeF(seen.size()) * scale);
        if (QImage picture = XcbCapture(native.toRect()); !picture.isNull()) {
            picture.setDevicePixelRatio(scale);
            return picture;
        }
        return screen->grabWindow(0, corner.x(), corner.y(), seen.width(), seen.height()).toImage();
    }

private:
    std::uint32_t nativeWindow() const { return static_cast<std::uint32_t>(m_view.winId()); }

    void rememberFocus() {
        // Inside of the active window or, in the middle of a click, with the window manager itself.
        const auto active = XcbActiveWindow();
        const auto focus = XcbInputFocus();
        m_focusBefore = active == 0 || XcbIsWithin(focus, active) ? focus : active;
    }

    void takeKeyboard() {
        // A focus that a window takes by itself, some of Wayland's compositors take away again at once.
        if (XcbIsUnderWayland()) m_keyboard = XcbGrabKeyboard(nativeWindow());
        if (m_keyboard) return;
        m_view.activateWindow();
        m_keySince = XcbServerTime();
        XcbSetInputFocus(nativeWindow(), m_keySince);
        XcbAnnounceServerTime(); // or a program started from the panel would not be given the keyboard
    }

    /// Whether a window is see-through is decided when it is made, so it is made anew where that changed.
    void followCompositor() {
        const bool translucent = XcbIsCompositing();
        if (translucent == m_view.testAttribute(Qt::WA_TranslucentBackground)) return;
        (m_view.*&NativeWindowOwner::destroy)(true, true);
        m_view.setAttribute(Qt::WA_NoSystemBackground, translucent);
        m_view.setAttribute(Qt::WA_TranslucentBackground, translucent);
        if (m_hasFilter) XcbBlurBehind(nativeWindow());
    }

    void place() {
        const KXRect item = m_ownArea();
        const QScreen* screen = ScreenAt(QtRectFromScreen(item).center());
        const KXRect available = screen ? ScreenRectFromQt(screen->availableGeometry()) : m_frame;
        const KXRect frame = PlacePanel(m_frame, item, available, QGuiApplication::isRightToLeft());
        m_view.setGeometry(QtRectFromScreen(frame).toRect());
    }

    bool eventFilter(QObject* watched, QEvent* event) override {
        if (watched == &m_view && event->type() == QEvent::WindowDeactivate) m_delegate.panelDidResignKey();
        const bool isKeyEvent = event->type() == QEvent::KeyPress || event->type() == QEvent::KeyRelease;
        if (isKeyEvent && watched == m_view.windowHandle()) {
            // With Shift held the key of Option is called Meta.
            const int key = static_cast<const QKeyEvent*>(event)->key();
            if (key == Qt::Key_Alt || key == Qt::Key_Meta)
                QMetaObject::invokeMethod(
                    this, [this] { tellOption(); }, Qt::QueuedConnection);
        }
        return false;
    }

    void tellOption() {
        m_delegate.panelFlagsChanged(QGuiApplication::queryKeyboardModifiers().testFlag(Qt::AltModifier));
    }

    bool nativeEventFilter(const QByteArray& eventType, void* message, qintptr*) override {
        if (eventType != "xcb_generic_event_t" || !isVisible()) return false;
        const auto button = XcbPressedButton(message);
        if (button && *button <= lastRealButton && isOutside(QCursor::pos())) m_delegate.panelDidResignKey();
        return false;
    }

    bool isOutside(QPoint point) const {
        if (XcbIsPointerAbove(nativeWindow()) || QtRectFromScreen(m_ownArea()).contains(point)) return false;
        const auto windows = QGuiApplication::topLevelWindows();
        return std::none_of(windows.begin(), windows.end(), [point](const QWindow* window) {
            return window->isVisible() && window->geometry().contains(point);
        });
    }

    QWidget& m_view;
    PanelDelegate& m_delegate;
    std::function<KXRect()> m_ownArea;
    KXRect m_frame;
    std::uint32_t m_focusBefore = 0;
    /// Given back as of this time: whom anybody gives the keyboard to for what the user did since keeps it,
    /// whoever is heard first, and though not all know how late it is.
    std::uint32_t m_keySince = 0;
    std::unique_ptr<Handle> m_keyboard;
    bool m_hasFilter = false;
};

} // namespace

KXRect QtWindowServer::visibleFrame(const KXRect& item) const {
    const QScreen* screen =
        item.width > 0 ? ScreenAt(QtRectFromScreen(item).center()) : QGuiApplication::primaryScreen();
    return screen ? RoomAtItem(item, ScreenRectFromQt(screen->availableGeometry())) : KXRect{};
}

bool QtWindowServer::hasWindowFilter() const {
    const static bool hasFilter = XcbAnnouncesBlurBehind();
    return hasFilter;
}

bool QtWindowServer::reducesMotion() const {
    return DesktopReducesMotion();
}

std::unique_ptr<PanelWindow> QtWindowServer::makePanel(QWidget& contentView, PanelDelegate& delegate,
                                                       std::function<KXRect()> ownArea) {
    return std::make_unique<QtPanelWindow>(contentView, delegate, std::move(ownArea));
}

} // namespace platform
