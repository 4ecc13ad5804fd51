#include "app/menuRow.h"

#include "app/menuMirroring.h"
#include "lib/base/Geometry.h"
#include "lib/kxAppKit/KXBezierPath.h"
#include "lib/kxAppKit/KXGeometry.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>

namespace {

constexpr float indentationWidth = 18;
constexpr float arrowRoom = 26;
constexpr float plainRightMargin = 11;
constexpr float checkmarkRoom = 15;
constexpr KXSize folderArrow{8, 10};
constexpr KXSize scrollArrow{10, 8};

constexpr std::array<MenuRowMetrics, 7> metricsByStyle{{
    {16, 4, 14, 20, 16},
    {16, 4, 8, 20, 10},
    {32, 8, 8, 40, 10},
    {16, 4, 8, 20, 10},
    {16, 4, 8, 20, 10},
    {16, 4, 8, 20, 16},
    {16, 4, 8, 20, 16},
}};
constexpr MenuRowMetrics otherMetrics{16, 4, 8, 20, 20};

float centred(float outer, float inner) {
    return std::round((outer - inner) * 0.5F);
}

KXRect arrowRect(const MenuRowContent& content, const MenuRowGeometry& geometry) {
    const float y = centred(content.size.height, folderArrow.height);
    const float x =
        content.style == SMMenuButtonStyleAllPrograms ? geometry.title.x + content.titleSize.width + 7
        : content.style == SMMenuButtonStyleBack      ? menuRowMetrics(content.style).inset
                                                 : content.size.width - folderArrow.width - plainRightMargin;
    return {x, y, folderArrow.width, folderArrow.height};
}

MenuRowGeometry mirrored(MenuRowGeometry geometry, const MenuRowContent& content) {
    // Titles are drawn from their left, so the mirror takes no more of the room than the title fills.
    geometry.title.width = std::min(geometry.title.width, content.titleSize.width);
    geometry.title = menuMirrored(geometry.title, content.size.width);
    for (auto* part : {&geometry.mark, &geometry.icon, &geometry.arrow})
        if (*part) *part = menuMirrored(**part, content.size.width);
    const bool left = geometry.arrowDirection == KXArrowDirectionLeft;
    geometry.arrowDirection = left ? KXArrowDirectionRight : KXArrowDirectionLeft;
    return geometry;
}

} // namespace

const MenuRowMetrics& menuRowMetrics(std::int32_t style) {
    const auto index = static_cast<std::size_t>(style);
    return index < metricsByStyle.size() ? metricsByStyle[index] : otherMetrics;
}

MenuRowGeometry menuRowGeometry(const MenuRowContent& content) {
    const MenuRowMetrics& metrics = menuRowMetrics(content.style);
    const float inset = static_cast<float>(content.indentation) * indentationWidth + metrics.inset;
    const float height = content.size.height;

    // Room for a mark is taken from the left only: the right edge of the title stays where it is without one.
    const bool markRoom = content.style == SMMenuButtonStyleBack || content.parentHasCheckmark;
    const bool narrow = content.hasArrow || content.parentHasCheckmark;
    MenuRowGeometry geometry;
    float x = (markRoom ? checkmarkRoom : 0) + inset;
    float width = content.size.width - (narrow ? arrowRoom : plainRightMargin) - inset;

    if (content.markSize) {
        const float room = content.markSize->width;
        geometry.mark = KXRectCenteringSize({x - (metrics.gap + room), 0, room, height}, *content.markSize);
    }
    if (content.iconAspect && content.style != SMMenuButtonStyleLeftPane) {
        const float side = metrics.iconSize;
        geometry.icon = KXRectFittingAspect({x, centred(height, side), side, side}, *content.iconAspect);
        x += side + metrics.gap;
        width -= side + metrics.gap;
    }
    geometry.title = {x, centred(height, content.titleSize.height), width, content.titleSize.height};
    if (content.hasArrow) geometry.arrow = arrowRect(content, geometry);
    if (content.style == SMMenuButtonStyleBack) geometry.arrowDirection = KXArrowDirectionLeft;
    return content.isMirrored ? mirrored(geometry, content) : geometry;
}

KXRect menuScrollArrowRect(KXSize size) {
    return {centred(size.width, scrollArrow.width), centred(size.height, scrollArrow.height),
            scrollArrow.width, scrollArrow.height};
}

std::int32_t menuScrollArrowDirection(std::int32_t style) {
    // Not the wrong way round: rows count y downwards, so "down" points up on the screen.
    return style == SMMenuButtonStyleScrollUp ? KXArrowDirectionDown : KXArrowDirectionUp;
}

float menuTitleWhite(std::int32_t style, bool enabled, bool highlighted) {
    if (highlighted) return 1;
    if (enabled) return 0;
    return style == SMMenuButtonStyleLeftPane ? 0.2F : 0.55F;
}

float menuArrowWhite(std::int32_t style, bool highlighted) {
    if (highlighted) return 1;
    return style == SMMenuButtonStyleLeftPane ? 0.25F : 0.4F;
}
