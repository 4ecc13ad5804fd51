#include "lib/kxAppKit/KXAffineTransform.h"
#include "lib/kxAppKit/KXGeometry.h"

#include <QPointF>
#include <gtest/gtest.h>
#include <limits>

namespace {

using Limits = std::numeric_limits<float>;
constexpr float nan = Limits::quiet_NaN(), infinity = Limits::infinity();

TEST(Geometry, TellsValidFromInvalid) {
    for (const float bad : {nan, infinity, -infinity, 0.0f, -0.0f, -1.0f}) {
        EXPECT_TRUE(KXSizeIsInvalid({1, bad}) && KXRectIsInvalid({0, 0, bad, 1})) << bad;
        EXPECT_EQ(KXSizeAspectRatio({bad, 1}) + KXSizeArea({1, bad}), 0) << bad;
        EXPECT_EQ(KXWidthForAspect(bad, 1) + KXHeightForAspect(1, bad), 0) << bad;
        EXPECT_FALSE(KXAspectIsWider(1, bad)) << bad;
        EXPECT_EQ(KXRectFittingAspect({0, 0, 1, 1}, bad), KXRect()) << bad;
        EXPECT_EQ(KXRectFillingAspect({0, 0, bad, 1}, 1), KXRect()) << bad;
    }
    for (const float good : {Limits::denorm_min(), 1.0f, Limits::max()})
        EXPECT_FALSE(KXLengthIsInvalid(good)) << good;
    EXPECT_FALSE(KXPointIsInvalid({0, -5}));
    EXPECT_TRUE(KXPointIsInvalid({nan, 0}));
    EXPECT_TRUE(KXRectIsInvalid({0, -infinity, 1, 1}));
}

TEST(Geometry, CentresFitsAndFills) {
    EXPECT_EQ(KXRectCenteringSize({0, 0, 20, 10}, {7.071f, 7.071f}), (KXRect{6, 1, 7.071f, 7.071f}));
    EXPECT_EQ(KXRectCenteringSize({0.25f, 0, 3, 4}, {4, 1}), (KXRect{-0.75f, 2, 4, 1}))
        << "half goes away from zero";
    const struct {
        KXRect rect;
        float aspect;
        KXRect fitting, filling;
    } cases[] = {
        {{0, 0, 32, 32}, 2, {0, 8, 32, 16}, {-16, 0, 64, 32}},
        {{0, 0, 32, 32}, 0.5f, {8, 0, 16, 32}, {0, -16, 32, 64}},
        {{1, 2, 32, 16}, 2, {1, 2, 32, 16}, {1, 2, 32, 16}},
        {{0, 0, 3, 2}, 1, {0.5f, 0, 2, 2}, {0, -0.5f, 3, 3}},
        {{0, 0, 2, 82}, 1.0f / 41, {0, 0, 2, 82}, {0, 0, 2, 82}}, // of which 82 times are not quite 2
    };
    for (const auto& [rect, aspect, fitting, filling] : cases) {
        EXPECT_EQ(KXRectFittingAspect(rect, aspect), fitting) << aspect;
        EXPECT_EQ(KXRectFillingAspect(rect, aspect), filling) << aspect;
    }
}

TEST(Geometry, CombinesRectangles) {
    EXPECT_EQ(KXIntegralRect({-0.5f, 0.25f, 1, 1}), (KXRect{-1, 0, 2, 2}));
    EXPECT_EQ(KXIntegralRect({3, 3, 0, 5}), KXRect());
    EXPECT_EQ(KXIntersectionRect({0, 0, 4, 4}, {2, 3, 9, 9}), (KXRect{2, 3, 2, 1}));
    EXPECT_EQ(KXIntersectionRect({0, 0, 4, 4}, {4, 0, 4, 4}), KXRect());
    const KXRect rects[] = {{9, 9, 0, 3}, {1, 1, 2, 2}, {5, 0, 1, 1}};
    EXPECT_EQ(KXUnionOfRects(rects), (KXRect{1, 0, 5, 3}));
    EXPECT_EQ(KXStringFromRect({0.5f, -1, 20, 1e9f}), "{{0.5, -1}, {20, 1e+09}}");
    EXPECT_EQ(KXPixelCount(nan), 0);
    EXPECT_EQ(KXPixelCount(-infinity), std::numeric_limits<int>::min());
    EXPECT_EQ(KXPixelCount(3e9f), std::numeric_limits<int>::max());
}

TEST(AffineTransform, CarriesBoundsOntoTheFrame) {
    const auto plain = KXAffineTransform::transformFromBounds({0, 0, 10, 10}, {100, 100, 20, 40});
    EXPECT_EQ(plain.value().map(QPointF(10, 10)), QPointF(120, 140));
    const auto kept = KXAffineTransform::transformConservingAspectFromBounds({0, 0, 10, 10}, {0, 0, 20, 40});
    EXPECT_EQ(kept.value().map(QPointF(5, 5)), QPointF(10, 20));
    EXPECT_EQ(kept.value().map(QPointF(0, 0)), QPointF(0, 10));
    EXPECT_FALSE(KXAffineTransform::transformFromBounds({0, 0, 0, 10}, {0, 0, 1, 1}));
    EXPECT_FALSE(KXAffineTransform::transformFromBounds({0, 0, 1, 1}, {nan, 0, 1, 1}));
    EXPECT_FALSE(KXAffineTransform::transformConservingAspectFromBounds({0, 0, 1, 1}, {0, 0, -1, 1}));
}

} // namespace
