// Where the parts of a row lie is held to pictures: TestMenuPictures.cpp.

#include "app/menuRow.h"

#include <gtest/gtest.h>

namespace {

TEST(MenuRow, IsMirroredPartByPart) {
    for (std::int32_t style = SMMenuButtonStyleLeftPane; style <= SMMenuButtonStyleAllPrograms; ++style) {
        MenuRowContent content;
        content.style = style;
        content.size = {290, 20};
        content.titleSize = {60, 15};
        content.hasArrow = content.parentHasCheckmark = true;
        content.markSize = KXSize{8, 15};
        content.iconAspect = 2.0F;
        const auto plain = menuRowGeometry(content);
        content.isMirrored = true;
        const auto mirrored = menuRowGeometry(content);
        const auto isMirror = [&](const auto& a, const auto& b) {
            return a.has_value() == b.has_value() &&
                   (!a || (a->x == content.size.width - b->maxX() && a->y == b->y && a->size() == b->size()));
        };
        EXPECT_TRUE(isMirror(mirrored.mark, plain.mark) && isMirror(mirrored.arrow, plain.arrow) &&
                    isMirror(mirrored.icon, plain.icon))
            << style;
        EXPECT_EQ(mirrored.title.maxX(), content.size.width - plain.title.x) << style;
        EXPECT_EQ(mirrored.title.width, content.titleSize.width)
            << "as wide as the text, so that it ends there";
        EXPECT_NE(mirrored.arrowDirection, plain.arrowDirection) << style;
    }
}

} // namespace
