#include "platform/linux/StatusItemWidget.h"

#include "platform/StatusBar.h"
#include "platform/linux/XcbPanel.h"

#include <QMouseEvent>
#include <QPainter>
#include <cstdint>

namespace platform {

StatusItemWidget::StatusItemWidget(StatusItemView& view, Qt::WindowFlags flags)
    : QWidget(nullptr, Qt::Window | Qt::FramelessWindowHint | Qt::WindowDoesNotAcceptFocus | flags)
    , m_view(view) {
    setAttribute(Qt::WA_ShowWithoutActivating);
    setWindowTitle(QStringLiteral("Tessel status item"));
    setToolTip(QString::fromStdString(view.toolTip()));
    setAccessibleName(toolTip());
}

bool StatusItemWidget::event(QEvent* event) {
    if (event->type() == QEvent::WinIdChange && internalWinId() != 0)
        XcbHoldTypingFromPress(static_cast<std::uint32_t>(internalWinId()));
    return QWidget::event(event);
}

void StatusItemWidget::paintEvent(QPaintEvent*) {
    QPainter painter(this);
    m_view.draw(painter, {static_cast<float>(width()), static_cast<float>(height())});
}

void StatusItemWidget::mousePressEvent(QMouseEvent* event) {
    if (event->button() == Qt::LeftButton) m_view.mouseDown();
    if (event->button() == Qt::RightButton) m_view.rightMouseDown();
    XcbLetTypingGo(); // the panel has the keyboard, or whoever had it before
}

} // namespace platform
