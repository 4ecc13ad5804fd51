#include "platform/linux/PanelPlacement.h"

#include "lib/base/Geometry.h"

#include <algorithm>
#include <optional>

namespace platform {

namespace {

constexpr float overhang = 1;

float placeAcross(const KXRect& wanted, const KXRect& item, const KXRect& available, bool rightToLeft) {
    const float withLeftEdges = item.minX() - overhang;
    const float choices[] = {rightToLeft ? withLeftEdges : wanted.x, rightToLeft ? wanted.x : withLeftEdges};
    for (const float x : choices)
        if (x >= available.minX() - overhang && x + wanted.width <= available.maxX() + overhang) return x;
    return std::max(available.minX(), std::min(wanted.x, available.maxX() - wanted.width));
}

float placeUpwards(const KXRect& wanted, const KXRect& item, const KXRect& available) {
    if (wanted.y >= available.minY()) return wanted.y;
    const bool isInSideBar = item.maxX() <= available.minX() || item.minX() >= available.maxX();
    // Beside the item there is room to slide; below or above it, the panel would come to lie on the item.
    if (isInSideBar) return std::min(available.minY(), available.maxY() - wanted.height);
    const float below = item.minY() - available.minY();
    const float above = available.maxY() - item.maxY();
    return above > below ? item.maxY() : wanted.y;
}

} // namespace

KXRect PlacePanel(const KXRect& wanted, const KXRect& item, const KXRect& available, bool rightToLeft) {
    if (item.width <= 0)
        return {rightToLeft ? available.minX() : available.maxX() - wanted.width,
                available.maxY() - wanted.height, wanted.width, wanted.height};
    return {placeAcross(wanted, item, available, rightToLeft), placeUpwards(wanted, item, available),
            wanted.width, wanted.height};
}

KXRect RoomAtItem(const KXRect& item, const KXRect& available) {
    const bool isAcross = item.width > 0 && item.minX() < available.maxX() && item.maxX() > available.minX();
    const float below = item.minY() - available.minY();
    const float above = available.maxY() - item.maxY();
    if (!isAcross || below < 0 || above < 0) return available;
    return {available.x, above > below ? item.maxY() : available.y, available.width, std::max(above, below)};
}

KXRect StatusItemFrameAt(std::optional<KXPoint> click, KXSize size, const KXRect& screen,
                         const KXRect& available) {
    const bool isBarAtBottom = available.maxY() >= screen.maxY() && available.minY() > screen.minY();
    const float halfHeight = size.height / 2;
    const KXPoint at = click.value_or(
        KXPoint{screen.maxX() - size.width / 2, isBarAtBottom ? screen.minY() : screen.maxY() - halfHeight});
    KXRect frame{at.x - size.width / 2, at.y - halfHeight, size.width, size.height};
    if (at.y >= available.maxY()) {
        frame.y = available.maxY();
        frame.height = screen.maxY() - available.maxY();
    } else if (at.y < available.minY()) {
        frame.y = screen.minY();
        frame.height = available.minY() - screen.minY();
    } else if (at.x < available.minX()) {
        frame.x = screen.minX();
        frame.width = available.minX() - screen.minX();
    } else if (at.x >= available.maxX()) {
        frame.x = available.maxX();
        frame.width = screen.maxX() - available.maxX();
    }
    return frame;
}

} // namespace platform
