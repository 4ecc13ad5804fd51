#pragma once

#include "lib/base/Geometry.h"

#include <QPainterPath>
#include <cstdint>

class QColor;
class QPainter;

enum KXArrowDirection : std::int32_t {
    KXArrowDirectionUp = 0,    ///< apex at maxY: in a view whose y grows downwards it points down
    KXArrowDirectionDown = 1,  ///< apex at minY
    KXArrowDirectionLeft = 2,  ///< apex at minX
    KXArrowDirectionRight = 3, ///< apex at maxX
};

/// A path and the width of its line. A value. Angles are in degrees from the x axis towards growing y.
class KXBezierPath {
public:
    KXBezierPath();

    /// The radius is not limited: above half a side the outline crosses itself.
    static KXBezierPath bezierPathWithRoundRect(const KXRect& rect, float radius);
    /// A closed triangle, to be filled; empty for any other direction.
    static KXBezierPath arrowInRect(const KXRect& rect, std::int32_t direction);
    /// Two open strokes, to be stroked; the line width is set.
    static KXBezierPath xSymbolInRect(const KXRect& rect, float scale);
    /// From `startColor` at minY to `endColor` at maxY, over the whole width of the current clip: x and width
    /// do not count. An invalid colour is transparent black.
    static void linearGradientFill(QPainter& painter, const KXRect& rect, const QColor& startColor,
                                   const QColor& endColor);

    void moveTo(KXPoint point);
    void lineTo(KXPoint point);
    void relativeLineTo(float dx, float dy);
    /// Runs with growing angle. Begins an empty path, else a line to the arc's start comes first.
    void appendArc(KXPoint center, float radius, float startAngle, float endAngle);
    void closePath();

    bool isEmpty() const { return m_path.isEmpty(); }
    KXRect bounds() const;
    const QPainterPath& path() const { return m_path; }
    float lineWidth() const { return m_lineWidth; }
    void setLineWidth(float width) { m_lineWidth = width; }

    void fill(QPainter& painter, const QColor& color) const;
    void stroke(QPainter& painter, const QColor& color) const;
    /// The outline wholly inside the path, as deep as the line is wide.
    void strokeInside(QPainter& painter, const QColor& color) const;
    /// The same, and only within `rect` unless that is empty.
    void strokeInsideWithinRect(QPainter& painter, const QColor& color, const KXRect& rect) const;

private:
    QPainterPath m_path;
    float m_lineWidth = 1;
};
