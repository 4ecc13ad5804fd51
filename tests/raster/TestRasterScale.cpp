#include "lib/raster/rasterScale.h"
#include "tests/support/ScratchHome.h"

#include <algorithm>
#include <cmath>
#include <gtest/gtest.h>
#include <random>
#include <vector>

namespace {

struct Picture {
    int width, height, pixelBytes, bytesPerRow;
    std::vector<std::uint8_t> bytes;

    Picture(int w, int h, int pixel = 4, int slack = 0)
        : width(w)
        , height(h)
        , pixelBytes(pixel)
        , bytesPerRow(w * pixel + slack)
        , bytes(static_cast<std::size_t>(bytesPerRow) * static_cast<std::size_t>(h)) {}
    std::uint8_t& at(int x, int y, int channel) {
        return bytes[static_cast<std::size_t>(y) * static_cast<std::size_t>(bytesPerRow) +
                     static_cast<std::size_t>(x * pixelBytes + channel)];
    }
};

struct Job {
    double scaleX = 1, scaleY = 1;
    int filter = 2, depthFrom = 32, depthTo = 32;
};

int scale(Picture& to, const RasterRect& rect, const Picture& from, Job job) {
    return Raster_Scale(to.bytes.data(), to.bytesPerRow, to.pixelBytes * 8, job.depthTo, to.width, to.height,
                        1, rect, from.bytes.data(), from.bytesPerRow, from.pixelBytes * 8, job.depthFrom, 0,
                        from.width, from.height, 1, job.scaleX, job.scaleY, job.filter);
}

int scale(Picture& to, const Picture& from, Job job) {
    return scale(to, RasterRect::fromSize(0, 0, to.width, to.height), from, job);
}

/// One channel of one destination pixel along one axis, from the definition and without thought of speed.
int sampled(auto&& channelAt, int count, int target, double scale, bool filter) {
    const auto step = static_cast<std::int64_t>(std::clamp(65536 / scale, 0.0, 4294967295.0));
    const auto value = [&](std::int64_t index) {
        return channelAt(static_cast<int>(std::clamp<std::int64_t>(index, 0, count - 1)));
    };
    std::int64_t position = target * step;
    if (!filter || step == 0x10000) return value(position >> 16);
    if (step < 0x10000) {
        position -= 0x8000;
        const int fraction = static_cast<int>(position & 0xFFFF);
        return (value(position >> 16) * ((0xFFFF - fraction) >> 8) +
                value((position + 0x10000) >> 16) * (fraction >> 8)) >>
               8;
    }
    std::int64_t sum = 0;
    const std::int64_t end = position + step;
    for (int taken = 0; position < end && taken < 32; ++taken) {
        const std::int64_t covered = std::min(((position >> 16) + 1) << 16, end) - position;
        sum += (value(position >> 16) * (covered == 0x10000 ? 255 : covered >> 8)) >> 8;
        position += covered;
    }
    return static_cast<int>(sum * 65536 / step);
}

std::uint8_t expected(Picture& from, int x, int y, int channel, const Job& job) {
    const bool filter = job.filter != 0 && job.depthTo >= 24;
    const auto row = [&](int sourceY) {
        return sampled([&](int sourceX) { return int{from.at(sourceX, sourceY, channel)}; }, from.width, x,
                       job.scaleX, filter);
    };
    return static_cast<std::uint8_t>(sampled(row, from.height, y, job.scaleY, filter));
}

TEST(RasterScale, EqualsItsDefinition) {
    std::mt19937 random(5);
    const auto below = [&](int limit) { return static_cast<int>(random() % static_cast<unsigned>(limit)); };
    for (int round = 0; round < 400; ++round) {
        const int pixel = round % 4 == 0 ? 3 : 4;
        Picture from(1 + below(70), 1 + below(24), pixel, below(6));
        Picture to(1 + below(90), 1 + below(24), pixel, below(6));
        for (auto& byte : from.bytes)
            byte = static_cast<std::uint8_t>(random() % 4 == 0 ? (random() % 2) * 255 : random());
        std::ranges::fill(to.bytes, 0x5A);
        Job job{static_cast<double>(to.width) / from.width, static_cast<double>(to.height) / from.height};
        job.filter = round % 5 ? 2 : 0;
        job.depthFrom = job.depthTo = pixel * 8;
        if (round % 3 == 0) job.scaleX *= std::exp2(below(9) - 4 + below(100) / 99.0);
        if (round % 7 == 0) job.scaleY *= std::exp2(below(9) - 4 + below(100) / 99.0);
        const int left = below(to.width + 1);
        const int top = below(to.height + 1);
        const RasterRect rect =
            RasterRect::fromSize(left, top, below(to.width - left + 1), below(to.height - top + 1));
        ASSERT_TRUE(scale(to, rect, from, job));
        const int row = to.width * pixel;
        for (int at = 0; at < to.height * row; ++at) {
            const int x = at % row / pixel, y = at / row, c = at % pixel;
            const bool inside = x >= rect.left && x < rect.right && y >= rect.top && y < rect.bottom;
            ASSERT_EQ(to.at(x, y, c), inside ? expected(from, x, y, c, job) : 0x5A)
                << "round " << round << " at " << x << ", " << y << ", channel " << c;
        }
    }
}

TEST(RasterScale, RefusesWhatItCannotDo) {
    const Picture from(8, 8);
    const struct {
        RasterRect rect;
        Job job;
        bool result;
    } cases[] = {{{0, 0, 9, 8}, {}, 0},
                 {{-1, 0, 8, 8}, {}, 0},
                 {{0, -1, 8, 9}, {}, 0},
                 {{4, 4, 4, 8}, {}, 1},
                 {{4, 4, 4, 8}, {NAN}, 0},
                 {{0, 0, 8, 8}, {0}, 0},
                 {{0, 0, 8, 8}, {1, -1}, 0},
                 {{0, 0, 8, 8}, {1.0 / 40000}, 0},
                 {{0, 0, 8, 8}, {HUGE_VAL, 1e9}, 1},
                 {{0, 0, 8, 8}, {1, 1.0 / 32767}, 0}};
    for (const auto& [rect, job, result] : cases) {
        Picture to(8, 8);
        EXPECT_EQ(scale(to, rect, from, job) != 0, result) << testing::PrintToString(&rect - &cases[0].rect);
    }
    const auto sized = [](int toWidth, int fromWidth, int fromHeight, int bytesPerRow, void* memory) {
        return Raster_Scale(memory, bytesPerRow, 32, 32, toWidth, 1, 1, {0, 0, 1, 1}, memory, bytesPerRow, 32,
                            32, 0, fromWidth, fromHeight, 1, 1.0, 1.0, 2);
    };
    std::uint32_t pixel = 7;
    EXPECT_FALSE(sized(32768, 1, 1, 1 << 20, &pixel));
    EXPECT_FALSE(sized(1, 1, 32768, 1 << 20, &pixel));
    EXPECT_TRUE(sized(32767, 1, 1, 1 << 20, &pixel));
    EXPECT_TRUE(sized(1, 0, 1, 4, nullptr)) << "nothing to scale, so no memory is touched";
    EXPECT_FALSE(sized(1, 1, 1, 4, nullptr));
    EXPECT_FALSE(sized(1, 1, 1, 3, &pixel)) << "rows too short for their width";
    EXPECT_FALSE(sized(1, -1, 1, 4, &pixel));
    EXPECT_EQ(pixel, 7U);
}

TEST(RasterScale, PacksIntoShallowerFormats) {
    Picture from(1, 1);
    from.bytes = {0xFF, 0x84, 0x48, 0x11};
    Picture rgb(2, 1, 3);
    EXPECT_TRUE(scale(rgb, from, {2, 1, 0, 24, 24}));
    EXPECT_EQ(rgb.bytes, (std::vector<std::uint8_t>{0xFF, 0x84, 0x48, 0xFF, 0x84, 0x48}));
    Picture packed(1, 1, 2);
    EXPECT_TRUE(scale(packed, from, {1, 1, 2, 24, 16}));
    EXPECT_EQ(packed.bytes[0] | packed.bytes[1] << 8, 0x1F | 0x21 << 5 | 0x09 << 11);
}

TEST(RasterScale, ReportsUnsupportedFormatsOnce) {
    const ScratchHome home;
    const Picture from(2, 2);
    Picture shallow(2, 2, 2);
    for (int i = 0; i < 2; ++i) {
        EXPECT_FALSE(scale(shallow, from, {1, 1, 2, 32, 16}));
        EXPECT_FALSE(scale(shallow, from, {1, 1, 2, 32, 24}));
        EXPECT_FALSE(scale(shallow, from, {1, 1, 2, 24, 32})) << "fewer bits than the depth";
    }
    Picture deep(2, 2);
    EXPECT_FALSE(scale(deep, from, {1, 1, 2, 24, 32}));
    for (const char* text :
         {": Raster_Scale: Color depth conversion from D32B32 to D16B16 is not supported.\n",
          ": Raster_Scale: Dest color format (depth 24, BPP 16) is not supported.\n"})
        EXPECT_EQ(ScratchHome::logged(text), 1) << text;
    EXPECT_EQ(ScratchHome::logged("\n"), 2) << ScratchHome::log();
}

} // namespace
