#pragma once

#include "lib/base/Geometry.h"

#include <QPointF>
#include <QRectF>

/// The same place as the toolkit's types have it. Which way y grows is the caller's.

inline QPointF KXQtPoint(KXPoint p) {
    return {static_cast<qreal>(p.x), static_cast<qreal>(p.y)};
}

inline QRectF KXQtRect(const KXRect& r) {
    return {static_cast<qreal>(r.x), static_cast<qreal>(r.y), static_cast<qreal>(r.width),
            static_cast<qreal>(r.height)};
}
