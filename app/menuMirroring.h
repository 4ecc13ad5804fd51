#pragma once

#include "lib/base/Geometry.h"

#include <QGuiApplication>

/// Where text runs from right to left the whole panel is mirrored. Places are worked out from left to right;
/// this turns them round in the end, and nothing else does.

inline bool menuIsMirrored() {
    return QGuiApplication::isRightToLeft();
}

/// The rectangle's mirror image in something that is `width` wide and begins at 0.
inline KXRect menuMirrored(const KXRect& rect, float width) {
    return {width - rect.maxX(), rect.y, rect.width, rect.height};
}
