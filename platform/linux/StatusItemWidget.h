#pragma once

#include "platform/StatusBar.h"

#include <QWidget>

namespace platform {

/// A window that shows a status item's view and takes its presses.
class StatusItemWidget : public QWidget {
public:
    StatusItemWidget(StatusItemView& view, Qt::WindowFlags flags);

protected:
    bool event(QEvent* event) override;
    void paintEvent(QPaintEvent* event) override;
    void mousePressEvent(QMouseEvent* event) override;
    void mouseDoubleClickEvent(QMouseEvent* event) override { mousePressEvent(event); }

private:
    StatusItemView& m_view;
};

} // namespace platform
