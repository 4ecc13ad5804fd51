#include "lib/kxAppKit/KXAffineTransform.h"

#include "lib/base/Geometry.h"
#include "lib/kxAppKit/KXGeometry.h"

#include <optional>

namespace KXAffineTransform {

std::optional<QTransform> transformFromBounds(const KXRect& bounds, const KXRect& frame) {
    if (KXRectIsInvalid(bounds) || KXRectIsInvalid(frame)) return std::nullopt;
    QTransform transform;
    transform.translate(static_cast<qreal>(frame.x), static_cast<qreal>(frame.y));
    transform.scale(static_cast<qreal>(frame.width / bounds.width),
                    static_cast<qreal>(frame.height / bounds.height));
    transform.translate(static_cast<qreal>(-bounds.x), static_cast<qreal>(-bounds.y));
    return transform;
}

std::optional<QTransform> transformConservingAspectFromBounds(const KXRect& bounds, const KXRect& frame) {
    return transformFromBounds(KXRectFillingAspect(bounds, KXSizeAspectRatio(frame.size())), frame);
}

} // namespace KXAffineTransform
