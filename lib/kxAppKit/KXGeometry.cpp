#include "lib/kxAppKit/KXGeometry.h"

#include "lib/base/Geometry.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <limits>
#include <span>
#include <string>

namespace {

bool isNoNumber(float v) {
    return std::isnan(v) || std::fabs(v) > std::numeric_limits<float>::max();
}

bool isEmpty(const KXRect& r) {
    return !(r.width > 0 && r.height > 0);
}

KXRect centredOn(const KXRect& r, KXSize s) {
    return {r.x + (r.width - s.width) * 0.5f, r.y + (r.height - s.height) * 0.5f, s.width, s.height};
}

std::string pairOf(float a, float b) {
    char text[64];
    std::snprintf(text, sizeof text, "{%g, %g}", static_cast<double>(a), static_cast<double>(b));
    return text;
}

} // namespace

bool KXLengthIsInvalid(float v) {
    return isNoNumber(v) || !(v > 0);
}

bool KXSizeIsInvalid(KXSize s) {
    return KXLengthIsInvalid(s.width) || KXLengthIsInvalid(s.height);
}

bool KXPointIsInvalid(KXPoint p) {
    return isNoNumber(p.x) || isNoNumber(p.y);
}

bool KXRectIsInvalid(const KXRect& r) {
    return KXSizeIsInvalid(r.size()) || KXPointIsInvalid(r.origin());
}

bool KXAspectIsInvalid(float a) {
    return KXLengthIsInvalid(a);
}

float KXSizeAspectRatio(KXSize s) {
    return KXSizeIsInvalid(s) ? 0 : s.width / s.height;
}

float KXSizeArea(KXSize s) {
    return KXSizeIsInvalid(s) ? 0 : s.width * s.height;
}

bool KXAspectIsWider(float a, float b) {
    return !KXAspectIsInvalid(a) && !KXAspectIsInvalid(b) && a > b;
}

float KXWidthForAspect(float a, float height) {
    return KXAspectIsInvalid(a) || KXLengthIsInvalid(height) ? 0 : a * height;
}

float KXHeightForAspect(float a, float width) {
    return KXAspectIsInvalid(a) || KXLengthIsInvalid(width) ? 0 : width / a;
}

KXRect KXRectCenteringSize(const KXRect& r, KXSize s) {
    return {r.x + std::round((r.width - s.width) * 0.5f), r.y + std::round((r.height - s.height) * 0.5f),
            s.width, s.height};
}

namespace {

KXRect withAspect(const KXRect& r, float a, bool fills) {
    if (KXAspectIsInvalid(a) || KXRectIsInvalid(r)) return {};
    const float own = KXSizeAspectRatio(r.size());
    // Width / height * height is not always the width again.
    if (a == own) return r;
    const bool keepsWidth = fills ? KXAspectIsWider(own, a) : KXAspectIsWider(a, own);
    return centredOn(r, keepsWidth ? KXSize{r.width, KXHeightForAspect(a, r.width)}
                                   : KXSize{KXWidthForAspect(a, r.height), r.height});
}

} // namespace

KXRect KXRectFittingAspect(const KXRect& r, float a) {
    return withAspect(r, a, false);
}

KXRect KXRectFillingAspect(const KXRect& r, float a) {
    return withAspect(r, a, true);
}

std::int32_t KXPixelCount(float count) {
    constexpr auto limits = std::numeric_limits<std::int32_t>();
    if (std::isnan(count)) return 0;
    return static_cast<std::int32_t>(
        std::clamp(static_cast<double>(count), double{limits.min()}, double{limits.max()}));
}

KXRect KXInsetRect(const KXRect& r, float dx, float dy) {
    return {r.x + dx, r.y + dy, r.width - 2 * dx, r.height - 2 * dy};
}

KXRect KXIntegralRect(const KXRect& r) {
    if (isEmpty(r)) return {};
    const float left = std::floor(r.minX());
    const float low = std::floor(r.minY());
    return {left, low, std::ceil(r.maxX()) - left, std::ceil(r.maxY()) - low};
}

KXRect KXIntersectionRect(const KXRect& a, const KXRect& b) {
    const float left = std::max(a.minX(), b.minX());
    const float low = std::max(a.minY(), b.minY());
    const KXRect common{left, low, std::min(a.maxX(), b.maxX()) - left, std::min(a.maxY(), b.maxY()) - low};
    return isEmpty(common) ? KXRect{} : common;
}

KXRect KXUnionRect(const KXRect& a, const KXRect& b) {
    if (isEmpty(a)) return isEmpty(b) ? KXRect{} : b;
    if (isEmpty(b)) return a;
    const float left = std::min(a.minX(), b.minX());
    const float low = std::min(a.minY(), b.minY());
    return {left, low, std::max(a.maxX(), b.maxX()) - left, std::max(a.maxY(), b.maxY()) - low};
}

KXRect KXUnionOfRects(std::span<const KXRect> rects) {
    KXRect all;
    for (const KXRect& rect : rects)
        all = KXUnionRect(all, rect);
    return all;
}

std::string KXStringFromPoint(KXPoint p) {
    return pairOf(p.x, p.y);
}

std::string KXStringFromSize(KXSize s) {
    return pairOf(s.width, s.height);
}

std::string KXStringFromRect(const KXRect& r) {
    return "{" + pairOf(r.x, r.y) + ", " + pairOf(r.width, r.height) + "}";
}
