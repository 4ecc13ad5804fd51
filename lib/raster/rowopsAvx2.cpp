#include "lib/raster/avx2.h"
#include "lib/raster/pixel.h"
#include "lib/raster/rowops.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <span>

namespace raster {

namespace avx2 {

namespace {

KX_AVX2 void enlargeNearest(std::uint8_t* to, const std::uint8_t* from, Sampling s, std::int64_t count) {
    const Ramp ramp(s.step);
    // Steps of a power of two come back to the same fraction with every eight pixels.
    const bool repeats = (lanes * s.step & 0xFFFF) == 0;
    Vector indices = _mm256_srli_epi32(ramp.at(s.position), 16);
    std::int64_t x = 0;
    for (; x + lanes <= count && (s.position >> 16) + lanes <= s.sourceCount;
         x += lanes, s.position += lanes * s.step) {
        if (!repeats) indices = _mm256_srli_epi32(ramp.at(s.position), 16);
        const Vector pixels = loadPixels(from + (s.position >> 16) * 4, lanes);
        storePixels(to + x * 4, _mm256_permutevar8x32_epi32(pixels, indices), lanes);
    }
    for (; x < count; x += lanes, s.position += lanes * s.step) {
        const std::int64_t index = s.position >> 16;
        indices = _mm256_srli_epi32(ramp.at(s.position), 16);
        const Vector pixels = loadPixels(from + index * 4, s.sourceCount - index);
        storePixels(to + x * 4, _mm256_permutevar8x32_epi32(pixels, indices), count - x);
    }
}

void reduceNearest(std::uint8_t* to, const std::uint8_t* from, Sampling s, std::int64_t count) {
    auto position = static_cast<std::uint64_t>(s.position);
#pragma GCC unroll 8
    for (std::int64_t x = 0; x < count; ++x, position += s.step)
        store(to + x * 4, load(from + (position >> 16) * 4));
}

KX_AVX2 void sampleNearest(std::uint8_t* to, const std::uint8_t* from, Sampling s, std::size_t count) {
    const RowParts parts(s, static_cast<std::int64_t>(count));
    fill(to, load(from), parts.before);
    to += parts.before * 4;
    s.position += parts.before * s.step;
    if (s.step == 0x10000)
        std::memcpy(to, from + (s.position >> 16) * 4, static_cast<std::size_t>(parts.between) * 4);
    else if (s.step < 0x10000)
        enlargeNearest(to, from, s, parts.between);
    else
        reduceNearest(to, from, s, parts.between);
    fill(to + parts.between * 4, load(from + std::ptrdiff_t{s.sourceCount - 1} * 4), parts.after);
}

} // namespace

extern constexpr RowOps rowOps{"AVX2",        permute,    premultiply,  unpremultiply, multiply,   blend,
                               sampleNearest, planLinear, sampleLinear, sampleBox,     averageRows};

} // namespace avx2

std::span<const RowOps* const> availableRowOps() {
    static constexpr const RowOps* all[] = {&scalarRowOps, &avx2::rowOps, &avx512::rowOps};
    static const std::size_t count = !__builtin_cpu_supports("avx2")         ? 1
                                     : !__builtin_cpu_supports("avx512vbmi") ? 2
                                                                             : 3;
    return {all, count};
}

} // namespace raster
