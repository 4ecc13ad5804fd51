#pragma once

#include "lib/base/Geometry.h"

#include <cstdint>
#include <span>
#include <string>

/// Validity, aspect and placing of rectangles. Pure; single precision. Nothing here knows which way y grows.
/// "Invalid" is NaN, infinite or, for lengths, not above 0.

bool KXLengthIsInvalid(float v);
bool KXSizeIsInvalid(KXSize s);
bool KXPointIsInvalid(KXPoint p); ///< zero and negative coordinates are valid
bool KXRectIsInvalid(const KXRect& r);
bool KXAspectIsInvalid(float a);

float KXSizeAspectRatio(KXSize s);             ///< width / height; 0 when invalid
float KXSizeArea(KXSize s);                    ///< 0 when invalid
bool KXAspectIsWider(float a, float b);        ///< false when either is invalid
float KXWidthForAspect(float a, float height); ///< 0 when either is invalid
float KXHeightForAspect(float a, float width); ///< 0 when either is invalid

/// A rectangle of size `s` in the middle of `r`; the offsets are whole, rounded half away from zero.
KXRect KXRectCenteringSize(const KXRect& r, KXSize s);
/// The largest rectangle of aspect `a` inside `r`, centred, not rounded; the zero rectangle when one is
/// invalid.
KXRect KXRectFittingAspect(const KXRect& r, float a);
/// The smallest rectangle of aspect `a` around `r`, centred, not rounded; the zero rectangle when one is
/// invalid.
KXRect KXRectFillingAspect(const KXRect& r, float a);

/// A number of pixels as an integer; NaN is 0, what is out of range is the nearest.
std::int32_t KXPixelCount(float count);

KXRect KXInsetRect(const KXRect& r, float dx, float dy);     ///< extents may become negative
KXRect KXIntegralRect(const KXRect& r);                      ///< grown to whole points; zero when empty
KXRect KXIntersectionRect(const KXRect& a, const KXRect& b); ///< zero when empty
KXRect KXUnionRect(const KXRect& a, const KXRect& b);        ///< an empty one does not count
KXRect KXUnionOfRects(std::span<const KXRect> rects);

std::string KXStringFromPoint(KXPoint p);      ///< "{x, y}"
std::string KXStringFromSize(KXSize s);        ///< "{w, h}"
std::string KXStringFromRect(const KXRect& r); ///< "{{x, y}, {w, h}}"
