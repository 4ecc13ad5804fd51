#pragma once

#include "lib/base/Geometry.h"

#include <QGuiApplication>
#include <QRectF>
#include <QScreen>

/// The system's screen coordinates count y upwards from the bottom of the primary screen, the toolkit's count
/// it downwards from the top of the desktop. x is the same. Both in logical pixels.
namespace platform {

inline double PrimaryScreenBottom() {
    const QScreen* screen = QGuiApplication::primaryScreen();
    if (!screen) return 0;
    const QRectF geometry = screen->geometry();
    return geometry.y() + geometry.height();
}

inline KXRect ScreenRectFromQt(const QRectF& rect, double primaryBottom = PrimaryScreenBottom()) {
    return {static_cast<float>(rect.x()), static_cast<float>(primaryBottom - rect.y() - rect.height()),
            static_cast<float>(rect.width()), static_cast<float>(rect.height())};
}

inline QRectF QtRectFromScreen(const KXRect& rect, double primaryBottom = PrimaryScreenBottom()) {
    return {rect.x, primaryBottom - rect.y - rect.height, rect.width, rect.height};
}

/// The screen under the point, which counts as the toolkit's do; the primary one where there is none. Null
/// without any screen.
inline QScreen* ScreenAt(const QPointF& point) {
    QScreen* screen = QGuiApplication::screenAt(point.toPoint());
    return screen ? screen : QGuiApplication::primaryScreen();
}

/// From the display's own pixels. Scaled screens keep their native origins.
inline QRectF QtRectFromNative(const QRectF& rect) {
    for (const QScreen* screen : QGuiApplication::screens()) {
        const QPointF origin = screen->geometry().topLeft();
        const double scale = screen->devicePixelRatio();
        if (QRectF(origin, QSizeF(screen->geometry().size()) * scale).contains(rect.center()))
            return {origin + (rect.topLeft() - origin) / scale, rect.size() / scale};
    }
    return rect;
}

} // namespace platform
