#include "app/menuRow.h"

#include <gtest/gtest.h>

namespace {

MenuRowContent rowOf(std::int32_t style, KXSize size = {290, 20}) {
    MenuRowContent content;
    content.style = style;
    content.size = size;
    content.titleSize = {60, 15};
    return content;
}

TEST(MenuRow, PutsTitleAndIconWhereTheStyleSays) {
    struct Case {
        std::int32_t style;
        KXSize size;
        std::optional<KXRect> icon;
        KXRect title;
    };
    const Case cases[] = {
        {SMMenuButtonStyleLeftPane, {170, 20}, {}, {14, 3, 145, 15}},
        {SMMenuButtonStyleList, {290, 20}, KXRect{8, 2, 16, 16}, {28, 3, 251, 15}},
        {SMMenuButtonStyleHome, {290, 40}, KXRect{8, 4, 32, 32}, {48, 13, 231, 15}},
        {99, {290, 20}, KXRect{8, 2, 16, 16}, {28, 3, 251, 15}},
    };
    for (const auto& c : cases) {
        auto content = rowOf(c.style, c.size);
        content.iconAspect = 1.0F;
        const auto geometry = menuRowGeometry(content);
        EXPECT_EQ(geometry.icon, c.icon) << c.style;
        EXPECT_EQ(geometry.title, c.title) << c.style;
        EXPECT_FALSE(geometry.arrow || geometry.mark) << c.style;
    }
    auto wide = rowOf(SMMenuButtonStyleHome, {290, 40});
    wide.iconAspect = 4.0F;
    EXPECT_EQ(menuRowGeometry(wide).icon, (KXRect{8, 16, 32, 8})) << "undistorted";
}

TEST(MenuRow, TakesRoomForMarksFromTheLeftOnly) {
    auto content = rowOf(SMMenuButtonStyleList);
    content.indentation = 2;
    content.parentHasCheckmark = true;
    content.markSize = KXSize{9, 15};
    const auto geometry = menuRowGeometry(content);
    EXPECT_EQ(geometry.title, (KXRect{15 + 36 + 8, 3, 290 - 26 - 44, 15}));
    EXPECT_EQ(geometry.mark, (KXRect{59 - 13, 3, 9, 15}));
}

TEST(MenuRow, PutsTheArrowByStyle) {
    auto folder = rowOf(SMMenuButtonStyleList);
    folder.hasArrow = true;
    EXPECT_EQ(menuRowGeometry(folder).arrow, (KXRect{290 - 19, 5, 8, 10}));
    EXPECT_EQ(menuRowGeometry(folder).title.width, 290 - 26 - 8);

    folder.style = SMMenuButtonStyleAllPrograms;
    EXPECT_EQ(menuRowGeometry(folder).arrow, (KXRect{8 + 60 + 7, 5, 8, 10}));
    EXPECT_EQ(menuRowGeometry(folder).arrowDirection, KXArrowDirectionRight);

    folder.style = SMMenuButtonStyleBack;
    EXPECT_EQ(menuRowGeometry(folder).arrow, (KXRect{8, 5, 8, 10}));
    EXPECT_EQ(menuRowGeometry(folder).arrowDirection, KXArrowDirectionLeft);
    EXPECT_EQ(menuRowGeometry(folder).title.x, 23);

    EXPECT_EQ(menuScrollArrowRect({291, 20}), (KXRect{141, 6, 10, 8}));
    EXPECT_EQ(menuScrollArrowDirection(SMMenuButtonStyleScrollUp), KXArrowDirectionDown);
}

TEST(MenuRow, IsMirroredPartByPart) {
    for (std::int32_t style = SMMenuButtonStyleLeftPane; style <= SMMenuButtonStyleAllPrograms; ++style) {
        auto content = rowOf(style);
        content.hasArrow = content.parentHasCheckmark = true;
        content.markSize = KXSize{8, 15};
        content.iconAspect = 2.0F;
        const auto plain = menuRowGeometry(content);
        content.isMirrored = true;
        const auto mirrored = menuRowGeometry(content);
        const auto isMirror = [&](const KXRect& a, const KXRect& b) {
            return a.x == content.size.width - b.maxX() && a.y == b.y && a.height == b.height;
        };
        EXPECT_TRUE(isMirror(*mirrored.mark, *plain.mark) && isMirror(*mirrored.arrow, *plain.arrow))
            << style;
        ASSERT_EQ(mirrored.icon.has_value(), plain.icon.has_value()) << style;
        EXPECT_TRUE(!plain.icon || isMirror(*mirrored.icon, *plain.icon)) << style;
        EXPECT_EQ(mirrored.title.maxX(), content.size.width - plain.title.x) << style;
        EXPECT_EQ(mirrored.title.width, content.titleSize.width)
            << "as wide as the text, so that it ends there";
        EXPECT_NE(mirrored.arrowDirection, plain.arrowDirection) << style;
    }
}

} // namespace
