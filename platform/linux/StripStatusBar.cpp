#include "platform/linux/StripStatusBar.h"

#include "lib/base/Geometry.h"
#include "platform/StatusBar.h"
#include "platform/linux/QtScreenCoordinates.h"
#include "platform/linux/StatusItemWidget.h"
#include "platform/linux/XcbDockWindow.h"

#include <QGuiApplication>
#include <QScreen>
#include <QStyle>
#include <QWidget>
#include <memory>
#include <vector>

namespace platform {

class StripStatusBar::Item final : public StatusItem {
public:
    Item(StripStatusBar& bar, StatusItemView& view, QSize size)
        : m_bar(bar)
        , m_widget(view, {}) {
        m_widget.setFixedSize(size);
        m_bar.m_items.push_back(this);
        followPrimaryScreen();
        QObject::connect(qGuiApp, &QGuiApplication::primaryScreenChanged, &m_widget,
                         [this] { followPrimaryScreen(); });
        MakeDockWindow(m_widget);
        m_widget.show();
        PutOnAllWorkspaces(m_widget);
    }

    ~Item() override {
        std::erase(m_bar.m_items, this);
        for (auto* item : m_bar.m_items)
            item->moveToPlace();
    }
    Item(const Item&) = delete;
    Item& operator=(const Item&) = delete;

    void setNeedsDisplay() override { m_widget.update(); }
    KXRect frame() const override { return ScreenRectFromQt(m_widget.geometry()); }

private:
    void followPrimaryScreen() {
        QObject::disconnect(m_screenGeometry);
        QScreen* screen = QGuiApplication::primaryScreen();
        if (!screen) return;
        m_screenGeometry =
            QObject::connect(screen, &QScreen::geometryChanged, &m_widget, [this] { moveToPlace(); });
        moveToPlace();
    }

    void moveToPlace() {
        const QScreen* screen = QGuiApplication::primaryScreen();
        if (!screen) return;
        int left = screen->geometry().x() + screen->geometry().width();
        for (const auto* item : m_bar.m_items) {
            left -= item->m_widget.width();
            if (item == this) break;
        }
        const QRect place({left, screen->geometry().y()}, m_widget.size());
        // Mirrored where text runs from right to left, as panels of such desktops are.
        m_widget.move(
            QStyle::visualRect(QGuiApplication::layoutDirection(), screen->geometry(), place).topLeft());
    }

    StripStatusBar& m_bar;
    StatusItemWidget m_widget;
    QMetaObject::Connection m_screenGeometry;
};

std::unique_ptr<StatusItem> StripStatusBar::addItem(float length, StatusItemView& view) {
    return std::make_unique<Item>(*this, view, QSizeF(length, thickness()).toSize());
}

} // namespace platform
