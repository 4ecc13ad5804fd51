#pragma once

#include "lib/base/Geometry.h"

#include <QTransform>
#include <optional>

/// Transforms that carry one rectangle onto another; empty when one of the two is invalid.
namespace KXAffineTransform {

std::optional<QTransform> transformFromBounds(const KXRect& bounds, const KXRect& frame);
/// Equal scale on both axes: the whole of `bounds` is visible in `frame`, centred.
std::optional<QTransform> transformConservingAspectFromBounds(const KXRect& bounds, const KXRect& frame);

} // namespace KXAffineTransform
