#pragma once

#include <QColor>

class QWindow;

/// Greys, and borders that fade while their window is not the active one.
namespace KXColor {

QColor blackWithAlpha(float alpha);
QColor whiteWithAlpha(float alpha);

/// `window` is the one that the view stands in; null when it stands in none, which counts as not active.
bool shouldDrawSecondaryHighlightForView(const QWindow* window);
QColor darkBorderForView(const QWindow* window);
QColor semiDarkBorderForView(const QWindow* window);

} // namespace KXColor
