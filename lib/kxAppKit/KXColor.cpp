#include "lib/kxAppKit/KXColor.h"

#include <QWindow>
#include <algorithm>

namespace KXColor {

namespace {

QColor white(float level, float alpha) {
    return QColor::fromRgbF(level, level, level, std::clamp(alpha, 0.0f, 1.0f));
}

} // namespace

QColor blackWithAlpha(float alpha) {
    return white(0, alpha);
}

QColor whiteWithAlpha(float alpha) {
    return white(1, alpha);
}

bool shouldDrawSecondaryHighlightForView(const QWindow* window) {
    return !(window && window->isActive());
}

QColor darkBorderForView(const QWindow* window) {
    return white(shouldDrawSecondaryHighlightForView(window) ? 0.529f : 0.25f, 1);
}

QColor semiDarkBorderForView(const QWindow* window) {
    return white(shouldDrawSecondaryHighlightForView(window) ? 0.933f : 0.85f, 1);
}

} // namespace KXColor
