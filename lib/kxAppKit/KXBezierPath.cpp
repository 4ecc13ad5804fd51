#include "lib/kxAppKit/KXBezierPath.h"

#include "lib/base/Geometry.h"
#include "lib/kxAppKit/KXGeometry.h"
#include "lib/kxAppKit/KXQtGeometry.h"

#include <QLinearGradient>
#include <QPainter>
#include <QPen>
#include <algorithm>
#include <cmath>
#include <cstdint>
#include <numbers>

namespace {

/// What the painter may still paint on, in its own coordinates.
QRectF paintableArea(const QPainter& painter) {
    if (painter.hasClipping()) return painter.clipBoundingRect();
    return painter.worldTransform().inverted().mapRect(QRectF(painter.window()));
}

QColor orTransparent(const QColor& color) {
    const QColor rgb = color.toRgb();
    return rgb.isValid() ? rgb : QColor(0, 0, 0, 0);
}

} // namespace

KXBezierPath::KXBezierPath() {
    m_path.setFillRule(Qt::WindingFill);
}

KXBezierPath KXBezierPath::bezierPathWithRoundRect(const KXRect& rect, float radius) {
    const KXRect inner = KXInsetRect(rect, radius, radius);
    KXBezierPath path;
    path.appendArc({inner.minX(), inner.minY()}, radius, 180, 270);
    path.relativeLineTo(inner.width, 0);
    path.appendArc({inner.maxX(), inner.minY()}, radius, 270, 360);
    path.relativeLineTo(0, inner.height);
    path.appendArc({inner.maxX(), inner.maxY()}, radius, 0, 90);
    path.relativeLineTo(-inner.width, 0);
    path.appendArc({inner.minX(), inner.maxY()}, radius, 90, 180);
    path.closePath();
    return path;
}

KXBezierPath KXBezierPath::arrowInRect(const KXRect& r, std::int32_t direction) {
    KXBezierPath path;
    if (direction < KXArrowDirectionUp || direction > KXArrowDirectionRight) return path;
    // The apex itself is rounded, not its distance from the edge.
    const float middleX = std::round(r.x + r.width * 0.5f);
    const float middleY = std::round(r.y + r.height * 0.5f);
    const KXPoint corners[4][3] = {
        {{r.minX(), r.minY()}, {middleX, r.maxY()}, {r.maxX(), r.minY()}},
        {{r.minX(), r.maxY()}, {middleX, r.minY()}, {r.maxX(), r.maxY()}},
        {{r.minX(), middleY}, {r.maxX(), r.minY()}, {r.maxX(), r.maxY()}},
        {{r.minX(), r.minY()}, {r.minX(), r.maxY()}, {r.maxX(), middleY}},
    };
    path.moveTo(corners[direction][0]);
    path.lineTo(corners[direction][1]);
    path.lineTo(corners[direction][2]);
    path.closePath();
    return path;
}

KXBezierPath KXBezierPath::xSymbolInRect(const KXRect& rect, float scale) {
    const float r = std::min(rect.width, rect.height) * scale * 0.5f;
    const float side = 2 * r * 0.70710677f;
    const KXRect square = KXRectCenteringSize(rect, {side, side});
    KXBezierPath path;
    path.moveTo({square.minX(), square.maxY()});
    path.lineTo({square.maxX(), square.minY()});
    path.moveTo({square.maxX(), square.maxY()});
    path.lineTo({square.minX(), square.minY()});
    path.setLineWidth(r * 0.35f);
    return path;
}

void KXBezierPath::linearGradientFill(QPainter& painter, const KXRect& rect, const QColor& startColor,
                                      const QColor& endColor) {
    QLinearGradient gradient(0, static_cast<qreal>(rect.minY()), 0, static_cast<qreal>(rect.maxY()));
    gradient.setInterpolationMode(QGradient::ComponentInterpolation);
    gradient.setColorAt(0, orTransparent(startColor));
    gradient.setColorAt(1, orTransparent(endColor));
    QRectF band = paintableArea(painter);
    band.setTop(static_cast<qreal>(rect.minY()));
    band.setBottom(static_cast<qreal>(rect.maxY()));
    painter.fillRect(band, gradient);
}

void KXBezierPath::moveTo(KXPoint point) {
    m_path.moveTo(KXQtPoint(point));
}

void KXBezierPath::lineTo(KXPoint point) {
    m_path.lineTo(KXQtPoint(point));
}

void KXBezierPath::relativeLineTo(float dx, float dy) {
    m_path.lineTo(m_path.currentPosition() + QPointF(static_cast<qreal>(dx), static_cast<qreal>(dy)));
}

// Not QPainterPath::arcTo: that leaves out an arc of radius 0, and with it the path's first point.
void KXBezierPath::appendArc(KXPoint center, float radius, float startAngle, float endAngle) {
    const auto unit = [](double angle) { return QPointF(std::cos(angle), std::sin(angle)); };
    const double radians = std::numbers::pi / 180;
    const int pieces = std::max(1, static_cast<int>(std::ceil(std::fabs(endAngle - startAngle) / 90)));
    const double sweep = static_cast<double>(endAngle - startAngle) * radians / pieces;
    const double handle = 4.0 / 3.0 * std::tan(sweep / 4);
    const QPointF c = KXQtPoint(center);
    const auto r = static_cast<double>(radius);
    double angle = static_cast<double>(startAngle) * radians;
    QPointF from = unit(angle);
    m_path.isEmpty() ? m_path.moveTo(c + r * from) : m_path.lineTo(c + r * from);
    for (int i = 0; i < pieces; ++i) {
        angle += sweep;
        const QPointF to = unit(angle);
        const QPointF leave(from.x() - handle * from.y(), from.y() + handle * from.x());
        const QPointF arrive(to.x() + handle * to.y(), to.y() - handle * to.x());
        m_path.cubicTo(c + r * leave, c + r * arrive, c + r * to);
        from = to;
    }
}

void KXBezierPath::closePath() {
    m_path.closeSubpath();
}

KXRect KXBezierPath::bounds() const {
    const QRectF r = m_path.boundingRect();
    return {static_cast<float>(r.x()), static_cast<float>(r.y()), static_cast<float>(r.width()),
            static_cast<float>(r.height())};
}

void KXBezierPath::fill(QPainter& painter, const QColor& color) const {
    painter.fillPath(m_path, color);
}

void KXBezierPath::stroke(QPainter& painter, const QColor& color) const {
    painter.strokePath(
        m_path, QPen(color, static_cast<qreal>(m_lineWidth), Qt::SolidLine, Qt::FlatCap, Qt::MiterJoin));
}

void KXBezierPath::strokeInside(QPainter& painter, const QColor& color) const {
    strokeInsideWithinRect(painter, color, {});
}

void KXBezierPath::strokeInsideWithinRect(QPainter& painter, const QColor& color, const KXRect& rect) const {
    painter.save();
    painter.setClipPath(m_path, Qt::IntersectClip);
    if (rect.width > 0 && rect.height > 0) painter.setClipRect(KXQtRect(rect), Qt::IntersectClip);
    KXBezierPath doubled = *this;
    doubled.setLineWidth(2 * m_lineWidth);
    doubled.stroke(painter, color);
    painter.restore();
}
