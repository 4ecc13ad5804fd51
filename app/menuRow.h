#pragma once

#include "lib/base/Geometry.h"
#include "lib/kxAppKit/KXBezierPath.h"

#include <cstdint>
#include <optional>

/// How a row of the menu draws and how high it is. A row with any other value is 20 high and draws like
/// `list`.
enum SMMenuButtonStyle : std::int32_t {
    SMMenuButtonStyleLeftPane = 0, ///< no icons
    SMMenuButtonStyleList = 1,     ///< search results and folders
    SMMenuButtonStyleHome = 2,     ///< pinned and frequently used applications
    SMMenuButtonStyleBack = 3,
    SMMenuButtonStyleAllPrograms = 4,
    SMMenuButtonStyleScrollUp = 5,
    SMMenuButtonStyleScrollDown = 6,
};

struct MenuRowMetrics {
    float iconSize;
    float gap;   ///< after the icon, and before a mark
    float inset; ///< of the content, from the left
    float height;
    float separatorHeight;
};

const MenuRowMetrics& menuRowMetrics(std::int32_t style);

/// What decides where the parts of a row lie. y grows downwards, the row begins at (0, 0).
struct MenuRowContent {
    std::int32_t style = SMMenuButtonStyleLeftPane;
    std::int32_t indentation = 0;
    KXSize size;
    bool hasArrow = false;
    bool parentHasCheckmark = false;
    bool isMirrored = false;
    KXSize titleSize; ///< unshortened
    std::optional<KXSize> markSize;
    std::optional<float> iconAspect; ///< width / height
};

struct MenuRowGeometry {
    KXRect title;
    std::optional<KXRect> mark;
    std::optional<KXRect> icon;
    std::optional<KXRect> arrow;
    std::int32_t arrowDirection = KXArrowDirectionRight;
};

MenuRowGeometry menuRowGeometry(const MenuRowContent& content);

/// Rows of the two scroll styles hold nothing but this arrow.
KXRect menuScrollArrowRect(KXSize size);
std::int32_t menuScrollArrowDirection(std::int32_t style);

/// Greys of a row, 0 black to 1 white.
float menuTitleWhite(std::int32_t style, bool enabled, bool highlighted);
float menuArrowWhite(std::int32_t style, bool highlighted);
