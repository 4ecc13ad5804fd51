#pragma once

#include <QImage>

/// The picture behind the menu where the display itself does not blur. Pure.

/// A Gaussian blur of an opaque picture that goes on beyond its edges as it ends there. `sigma` is in pixels.
QImage blurredImage(const QImage& image, double sigma);

/// The screen blurred by 8 points, in its own size. Null for one that is less than 2 pixels wide.
QImage menuBackground(const QImage& screen);
