#include "lib/raster/rowops.h"
#include "tests/support/ScratchHome.h"

#include <functional>
#include <gtest/gtest.h>
#include <optional>
#include <random>
#include <vector>

using namespace raster;
using Bytes = std::vector<std::uint8_t>;

namespace {

TEST(RowOps, ColourArithmeticIsExact) {
    for (unsigned round = 0; round < 2 * 256; ++round) {
        const unsigned a = round / 2, alphaByte = round % 2 * 3;
        Bytes row(1024);
        for (unsigned i = 0; i < row.size(); ++i)
            row[i] = static_cast<std::uint8_t>(i % 4 == alphaByte ? a : i / 4);
        Bytes back = row, straight(row.size(), static_cast<std::uint8_t>(a * 7)), clear = straight;
        Raster_Multiply({straight.data(), 0, 256, 1}, {false, true}, row.data(), 0, {alphaByte == 0, false});
        Raster_Multiply({clear.data(), 0, 256, 1}, {true, true}, row.data(), 0, {alphaByte == 0, true});
        Raster_Premultiply({row.data(), 0, 256, 1}, static_cast<int>(alphaByte));
        Raster_Unpremultiply({back.data(), 0, 256, 1}, static_cast<int>(alphaByte));
        for (std::size_t c = 0; c < 256; ++c) {
            const std::size_t m = (c * a + 127) / 255, t = a * 7 & 255;
            ASSERT_EQ(row[c * 4 + 1], m);
            ASSERT_EQ(back[c * 4 + 2], a == 0 ? 0 : std::min<std::size_t>(255, (c * 255 + a / 2) / a));
            ASSERT_EQ(back[c * 4 + alphaByte], a);
            ASSERT_EQ(straight[c * 4 + 2], t - (t * (a - m) + 127) / 255);
            ASSERT_EQ(clear[c * 4 + 2], t - (t * (a - std::min<std::size_t>(a, c)) + 127) / 255);
            ASSERT_TRUE(straight[c * 4 + 3] == t && clear[c * 4] == t) << "alpha stays";
        }
    }
}

TEST(RowOps, EverySumIsAveragedExactly) {
    constexpr std::size_t largest = std::size_t{32} * 254, sums = largest + 4;
    std::vector<Bytes> bytes(BoxRun::maximum, Bytes(sums));
    const std::uint8_t* rows[BoxRun::maximum];
    for (unsigned row = 0; row < bytes.size(); rows[row] = bytes[row].data(), ++row)
        for (unsigned sum = row * 254; sum < sums; ++sum)
            bytes[row][sum] = static_cast<std::uint8_t>(std::min(sum - row * 254 + 1, 255U));
    BoxRun run{0, BoxRun::maximum, {}};
    std::fill_n(run.weights, run.count, std::uint8_t{255});
    for (std::uint64_t step = 0x10001; step <= 0xFFFFFFFF; step += step / 41 | 1)
        for (const RowOps* ops : availableRowOps()) {
            Bytes averages(sums);
            ops->averageRows(averages.data(), rows, run, static_cast<std::uint32_t>(step), sums / 4);
            for (std::size_t sum = 0; sum <= largest && sum << 16 <= step * 255; ++sum)
                ASSERT_EQ(averages[sum], (sum << 16) / step) << ops->name << ", step " << step;
        }
}

TEST(RowOps, BlockCopyTakesPixelsOfOneToFourBytes) {
    const ScratchHome home;
    const Bytes source{1, 2, 3, 4, 5, 6, 7, 8, 9};
    Bytes target(9);
    EXPECT_TRUE(Raster_CopyBlock({target.data(), 3}, {source.data(), 3}, 1, {1, 0, 3, 2}, 0, 1));
    EXPECT_EQ(target, (Bytes{0, 0, 0, 2, 3, 0, 5, 6, 0}));
    EXPECT_FALSE(Raster_CopyBlock({target.data(), 9}, {source.data(), 9}, 5, {0, 0, 1, 1}, 0, 0));
    EXPECT_EQ(ScratchHome::logged(": Raster: Unsupported frame buffer depth\n"), 1);
}

/// Below the limit.
using Random = std::function<std::uint32_t(std::uint32_t limit)>;

/// Runs `job` with every table on the same random bytes, at odd addresses, and compares what it leaves.
void expectSameOnAllTables(unsigned seed, auto&& job) {
    std::optional<Bytes> reference;
    for (const RowOps* ops : availableRowOps()) {
        std::mt19937 numbers(seed);
        const Random random = [&](std::uint32_t limit) {
            return static_cast<std::uint32_t>(numbers() % limit);
        };
        Bytes bytes(6144);
        for (auto& byte : bytes)
            byte = static_cast<std::uint8_t>(random(4) == 0 ? random(2) * 255 : random(256));
        job(*ops, bytes.data() + 1, random);
        if (!reference) reference = bytes;
        ASSERT_EQ(bytes, *reference) << ops->name << ", seed " << seed;
    }
}

TEST(RowOps, EveryInstructionSetGivesTheSameBytes) {
    constexpr std::ptrdiff_t from = 3001;
    for (unsigned seed = 0; seed < 71 * 10; ++seed) {
        const std::size_t count = seed % 71;
        const bool flag = seed & 1;
        expectSameOnAllTables(seed, [&](const RowOps& ops, std::uint8_t* to, const Random& random) {
            const std::uint8_t* const source = to + from + random(7);
            const bool whole = seed % 3 == 0;
            const int sourceCount = 1 + static_cast<int>(random(80));
            switch (seed / 71) {
            case 0: {
                const std::size_t rows = 1 + seed % 3;
                const std::size_t width = count / rows;
                const auto stride = static_cast<std::ptrdiff_t>(width * 4 + 3);
                return ops.permute({to, stride, width, rows}, source + stride * 2, flag ? stride : -stride,
                                   flag ? rasterBGRAToARGB : rasterRGBAToARGB);
            }
            case 1:
                return ops.permute({to, 0, count, 1}, to, 0, rasterARGBToRGBA);
            case 2:
                return ops.premultiply(to, count, flag ? 0 : 3);
            case 3:
                return ops.unpremultiply(to, count, flag ? 0 : 3);
            case 4:
                return ops.multiply(to, {flag, true}, source, {random(2) == 0, random(2) == 0}, count);
            case 5: {
                const std::uint8_t weights[] = {static_cast<std::uint8_t>(random(256)), 0, 255, 64};
                return ops.blend({to, 283}, source + 300, source + 600, std::span(weights).subspan(seed % 4),
                                 count);
            }
            case 6: {
                LinearPlan plan({random(0x80000) - 0x8000L, random(0x10000), sourceCount},
                                static_cast<std::int64_t>(count));
                if (ops.planLinear) ops.planLinear(plan);
                return ops.sampleLinear(to, source, plan);
            }
            case 7: {
                const std::uint32_t step = random(flag ? 0x20000 : 0x400000);
                return ops.sampleNearest(to, source, {random(0x80000), step, sourceCount}, count);
            }
            case 8: {
                const std::uint32_t step =
                    whole ? 0x20000U << random(3) : 0x10001 + random(flag ? 0x40000 : 0x400000);
                const std::uint32_t start = random(8) << 16 | (whole ? 0 : random(0x10000));
                const std::size_t rows = 1 + random(RowOps::mostBoxRows);
                return ops.sampleBox({to, 311}, {source, 353}, rows, {start, step, sourceCount}, count);
            }
            default: {
                const std::uint32_t step =
                    whole ? 0x20000U << random(6) : 0x10001 + random(flag ? 0x40000 : 0x400000);
                const std::uint8_t* rows[BoxRun::maximum];
                for (auto& row : rows)
                    row = source + random(700);
                return ops.averageRows(to, rows, boxRun(random(0x10000), step), step, count);
            }
            }
        });
    }
}

} // namespace
