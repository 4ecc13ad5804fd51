#pragma once

#include <QPainter>
#include <QPixmap>
#include <QWidget>

/// A picture of what a widget shows, painted anew only where its size or its screen's scale has changed, or
/// after `invalidate`. Main thread only.
class MenuPicture {
public:
    void invalidate() { m_pixmap = {}; }

    /// `paint` gets a painter over a picture of the widget, filled with `background`.
    template <typename Paint>
    void draw(QPainter& painter, const QWidget& widget, Paint paint,
              const QColor& background = Qt::transparent) {
        const double ratio = widget.devicePixelRatioF();
        const QSize size = (QSizeF(widget.size()) * ratio).toSize();
        if (m_pixmap.size() != size || m_pixmap.devicePixelRatio() != ratio) {
            m_pixmap = QPixmap(size);
            m_pixmap.setDevicePixelRatio(ratio);
            m_pixmap.fill(background);
            QPainter onPicture(&m_pixmap);
            paint(onPicture);
        }
        painter.drawPixmap(0, 0, m_pixmap);
    }

private:
    QPixmap m_pixmap;
};
