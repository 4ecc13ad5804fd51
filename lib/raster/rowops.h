#pragma once

#include "lib/raster/rasterops.h"

#include <algorithm>
#include <span>

/// The inner loops over rows of 32-bit pixels, one table of functions for each instruction set. All
/// tables give the same bytes. Pixels stand at any address; a destination is its source or does not overlap
/// it.
namespace raster {

/// Positions and steps are 16.16 fixed point in source pixels; indices are limited to 0 ... sourceCount - 1.
struct Sampling {
    std::int64_t position;
    std::uint32_t step;
    std::int32_t sourceCount;
};

/// How many of `count` positions lie below `limit`.
inline std::int64_t countBelow(std::int64_t limit, const Sampling& s, std::int64_t count) {
    if (s.position >= limit) return 0;
    if (s.step == 0) return count;
    return std::min(count, (limit - s.position + s.step - 1) / s.step);
}

/// The parts of an enlarged row: left of the first pixel and from the last one on, both neighbours are the
/// same.
struct RowParts {
    std::int64_t before;
    std::int64_t between;
    std::int64_t after;
    RowParts(const Sampling& s, std::int64_t count) {
        before = countBelow(0, s, count);
        between = countBelow(std::int64_t{s.sourceCount - 1} << 16, s, count) - before;
        between = std::max<std::int64_t>(between, 0);
        after = count - before - between;
    }
};

/// What the rows of one enlargement have in common. Its size does not depend on theirs.
struct LinearPlan {
    static constexpr std::size_t kernelBytes = 8192;
    Sampling sampling;
    std::int64_t count;
    RowParts parts;
    alignas(64) std::byte kernel[kernelBytes]; ///< for the instruction set that completes the plan

    LinearPlan(const Sampling& s, std::int64_t pixels)
        : sampling(s)
        , count(pixels)
        , parts(s, pixels) {}
};

/// One run of a box average: the rows or pixels first ... first + count - 1 with their weights. More than the
/// maximum are left out, and the average divides by the whole step all the same: such reductions grow darker.
struct BoxRun {
    static constexpr int maximum = 32;
    std::int64_t first;
    int count;
    std::uint8_t weights[maximum];
};
/// The pixels that the span of one step from a position covers, the parts at both ends with their share.
BoxRun boxRun(std::int64_t position, std::uint32_t step);

struct RowOps {
    const char* name;
    /// Fills `block` from rows that stand `fromBytesPerRow` apart, downwards or, if negative, upwards.
    void (*permute)(const RasterBlock& block, const std::uint8_t* from, std::ptrdiff_t fromBytesPerRow,
                    const RasterChannelMap& map);
    void (*premultiply)(std::uint8_t* pixels, std::size_t count, int alphaByte);
    void (*unpremultiply)(std::uint8_t* pixels, std::size_t count, int alphaByte);
    void (*multiply)(std::uint8_t* to, RasterLayout toLayout, const std::uint8_t* from,
                     RasterLayout fromLayout, std::size_t count);
    static constexpr std::int64_t mostBlends = 4;
    /// One row for each of 1 to `mostBlends` weights, (a * (255 - weight) + b * weight) >> 8. No row is a or
    /// b.
    void (*blend)(RasterRows<std::uint8_t> to, const std::uint8_t* a, const std::uint8_t* b,
                  std::span<const std::uint8_t> weights, std::size_t count);
    void (*sampleNearest)(std::uint8_t* to, const std::uint8_t* from, Sampling sampling, std::size_t count);
    /// Completes a plan; may be null.
    void (*planLinear)(LinearPlan& plan);
    void (*sampleLinear)(std::uint8_t* to, const std::uint8_t* from, const LinearPlan& plan);
    static constexpr std::size_t mostBoxRows = 8;
    /// The same boxes of 1 to `mostBoxRows` rows.
    void (*sampleBox)(RasterRows<std::uint8_t> to, RasterRows<const std::uint8_t> from, std::size_t rows,
                      Sampling sampling, std::size_t count);
    /// The average of `run.count` rows; `rows` is parallel to the weights.
    void (*averageRows)(std::uint8_t* to, const std::uint8_t* const* rows, const BoxRun& run,
                        std::uint32_t step, std::size_t count);
};

extern const RowOps scalarRowOps; ///< plain C++, the reference
namespace avx2 {
extern const RowOps rowOps;
}
namespace avx512 {
extern const RowOps rowOps; ///< needs VBMI, byte permutations over a whole vector
}
/// Every table that this machine can run; the first is the plain reference, the last the fastest.
std::span<const RowOps* const> availableRowOps();
const RowOps& rowOps(); ///< the fastest

} // namespace raster
