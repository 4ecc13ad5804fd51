#pragma once

#include "app/SMMenuHostWidget.h"
#include "app/SMMenuWindowOutlets.h"
#include "app/menuPicture.h"
#include "lib/kxAppKit/KXBezierPath.h"

#include <QImage>

/// The window's content view: clips to the window's outline, paints the background and the panes, and tells
/// the mouse to the window's delegate.
class SMThemeView final : public SMMenuHostWidget {
public:
    /// Frames of panes, y upwards.
    struct Panes {
        KXRect top;
        KXRect right;
        friend bool operator==(const Panes&, const Panes&) = default;
    };

    explicit SMThemeView(QWidget* parent = nullptr);

    void setDelegate(SMMenuWindowEvents* delegate) { m_delegate = delegate; }
    void setPanes(const Panes& panes);

    /// Drawn behind everything; null for none.
    const QImage& backgroundImage() const { return m_backgroundImage; }
    void setBackgroundImage(QImage image);

    /// A child that takes the mouse for itself.
    void trackMouseOver(QWidget& child);

    /// Square corners at the top, round ones at the bottom; y upwards.
    static KXBezierPath windowPath(const KXRect& bounds);

protected:
    bool event(QEvent* event) override;
    bool eventFilter(QObject* child, QEvent* event) override;
    void paintEvent(QPaintEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;
    void showEvent(QShowEvent* event) override;
    void mouseMoveEvent(QMouseEvent* event) override;
    void mousePressEvent(QMouseEvent* event) override;
    void mouseReleaseEvent(QMouseEvent* event) override;
    void enterEvent(QEnterEvent* event) override;
    void leaveEvent(QEvent* event) override;
    void wheelEvent(QWheelEvent* event) override;

private:
    KXPoint upwards(QPointF point) const;
    QPainterPath outline() const;
    void updateShape();
    void drawChrome(QPainter& painter) const;
    void drawRightPane(QPainter& painter) const;
    void drawTopPane(QPainter& painter) const;

    SMMenuWindowEvents* m_delegate = nullptr;
    Panes m_panes;
    QImage m_backgroundImage;
    MenuPicture m_chrome; ///< all of it
    int m_chromeVariant = 0;
    QSize m_shapeSize;
    bool m_isShapeTranslucent = false;
};
