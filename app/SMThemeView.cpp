#include "app/SMThemeView.h"

#include "app/SMMenuHostWidget.h"
#include "app/menuPainter.h"
#include "app/menuPicture.h"
#include "lib/base/Geometry.h"
#include "lib/kxAppKit/KXBezierPath.h"
#include "lib/kxAppKit/KXColor.h"
#include "lib/kxAppKit/KXGeometry.h"

#include <QMouseEvent>
#include <QPainter>
#include <QRegion>
#include <QWheelEvent>
#include <utility>

namespace {

constexpr float cornerRadius = 5;
constexpr float paneRadius = 3;
constexpr double wheelNotch = 120;

/// What shows through the wash where nothing can be seen behind the window.
constexpr QRgb plainBackground = qRgb(236, 237, 240);

} // namespace

SMThemeView::SMThemeView(QWidget* parent)
    : SMMenuHostWidget(parent) {
    setMouseTracking(true);
    setAttribute(Qt::WA_OpaquePaintEvent); // the corners too: see-through, or cut off
}

void SMThemeView::setPanes(const Panes& panes) {
    if (panes == m_panes) return;
    m_panes = panes;
    m_chrome.invalidate();
    update();
}

void SMThemeView::setBackgroundImage(QImage image) {
    if (image.isNull() && m_backgroundImage.isNull()) return;
    m_backgroundImage = std::move(image);
    m_chrome.invalidate();
    update();
}

KXBezierPath SMThemeView::windowPath(const KXRect& bounds) {
    const KXRect inner = KXInsetRect(bounds, cornerRadius, cornerRadius);
    KXBezierPath path;
    path.moveTo({bounds.minX(), bounds.maxY()});
    path.relativeLineTo(0, -(bounds.height - cornerRadius));
    path.appendArc({inner.minX(), inner.minY()}, cornerRadius, 180, 270);
    path.relativeLineTo(inner.width, 0);
    path.appendArc({inner.minX() + inner.width, inner.minY()}, cornerRadius, 270, 360);
    path.relativeLineTo(0, inner.height);
    path.relativeLineTo(0, cornerRadius);
    path.closePath();
    return path;
}

QPainterPath SMThemeView::outline() const {
    const KXRect bounds{0, 0, static_cast<float>(width()), static_cast<float>(height())};
    return QTransform(1, 0, 0, -1, 0, height()).map(windowPath(bounds).path());
}

void SMThemeView::paintEvent(QPaintEvent*) {
    if (const int variant = tools().colorVariant(); variant != m_chromeVariant) {
        m_chromeVariant = variant;
        m_chrome.invalidate();
    }
    // Where nothing shows through, a picture without an alpha channel: copying it is quick.
    const QColor background = testAttribute(Qt::WA_TranslucentBackground) ? Qt::transparent : Qt::black;
    QPainter painter(this);
    m_chrome.draw(
        painter, *this, [this](QPainter& onPicture) { drawChrome(onPicture); }, background);
}

void SMThemeView::drawChrome(QPainter& painter) const {
    const QPainterPath path = outline();
    painter.setRenderHint(QPainter::Antialiasing);
    painter.setClipPath(path);
    if (!testAttribute(Qt::WA_TranslucentBackground)) painter.fillRect(rect(), QColor(plainBackground));
    painter.drawImage(QPoint(), m_backgroundImage);

    const float washHeight = static_cast<float>(height()) - m_panes.top.height;
    tools().fillWhite(painter, {0, m_panes.top.height, static_cast<float>(width()), washHeight}, 0.9F, 0.4F);
    painter.strokePath(path, QPen(Qt::white, 1));
    drawRightPane(painter);
    drawTopPane(painter);
}

void SMThemeView::drawRightPane(QPainter& painter) const {
    const KXRect right = fromUpwards(m_panes.right);
    const auto rounded = [&](float grow) {
        return KXBezierPath::bezierPathWithRoundRect(KXInsetRect(right, -grow, -grow), paneRadius);
    };
    rounded(1.5F).stroke(painter, KXColor::whiteWithAlpha(0.5F));
    rounded(0.5F).stroke(painter, KXColor::blackWithAlpha(0.5F));
    rounded(0).fill(painter, Qt::white);
}

void SMThemeView::drawTopPane(QPainter& painter) const {
    const KXRect top = KXInsetRect(fromUpwards(m_panes.top), 1, 0);
    painter.setRenderHint(QPainter::Antialiasing, false);
    tools().fillGradient(painter, top, MenuGradientUse::topPane);
    tools().fillWhite(painter, {top.x, top.maxY() - 1, top.width, 1}, 0, 0.5F);
}

bool SMThemeView::event(QEvent* event) {
    // Before the painting, since laying out asks for more of it.
    if (event->type() == QEvent::UpdateRequest && m_delegate) m_delegate->viewWillDraw();
    return SMMenuHostWidget::event(event);
}

void SMThemeView::trackMouseOver(QWidget& child) {
    child.installEventFilter(this);
}

bool SMThemeView::eventFilter(QObject* child, QEvent* event) {
    if (event->type() == QEvent::Enter && m_delegate) {
        const QPointF inChild = static_cast<QEnterEvent*>(event)->position();
        m_delegate->mouseMoved(upwards(static_cast<QWidget*>(child)->mapTo(this, inChild)));
    }
    return false;
}

void SMThemeView::resizeEvent(QResizeEvent*) {
    updateShape();
}

void SMThemeView::showEvent(QShowEvent*) {
    updateShape();
}

void SMThemeView::updateShape() {
    const bool translucent = testAttribute(Qt::WA_TranslucentBackground);
    if (m_shapeSize == size() && m_isShapeTranslucent == translucent) return;
    m_shapeSize = size();
    m_isShapeTranslucent = translucent;
    m_chrome.invalidate();
    // Without a compositor the corners of a see-through window would be black.
    if (translucent)
        clearMask();
    else
        setMask(QRegion(outline().toFillPolygon().toPolygon()));
}

KXPoint SMThemeView::upwards(QPointF point) const {
    return {static_cast<float>(point.x()), static_cast<float>(height() - point.y())};
}

void SMThemeView::mouseMoveEvent(QMouseEvent* event) {
    if (m_delegate) m_delegate->mouseMoved(upwards(event->position()));
}

void SMThemeView::mousePressEvent(QMouseEvent* event) {
    if (m_delegate && event->button() == Qt::LeftButton) m_delegate->mouseDown(upwards(event->position()));
}

void SMThemeView::mouseReleaseEvent(QMouseEvent* event) {
    if (m_delegate && event->button() == Qt::LeftButton) m_delegate->mouseUp(upwards(event->position()));
}

void SMThemeView::enterEvent(QEnterEvent* event) {
    if (m_delegate) m_delegate->mouseMoved(upwards(event->position()));
}

void SMThemeView::leaveEvent(QEvent*) {
    if (m_delegate) m_delegate->mouseExited();
}

void SMThemeView::wheelEvent(QWheelEvent* event) {
    if (m_delegate) m_delegate->scrollWheel(event->angleDelta().y() / wheelNotch, upwards(event->position()));
}
