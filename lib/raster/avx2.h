#pragma once

#include "lib/raster/pixel.h"
#include "lib/raster/rowops.h"

#include <immintrin.h>

// The functions carry the instruction set themselves: compiled with it as a whole, a file would also hand
// inline functions that use it to the rest of the program.
#define KX_AVX2 [[gnu::target("avx2")]]
// For what a loop over pixels calls from several places.
#define KX_AVX2_INLINE [[gnu::target("avx2"), gnu::always_inline]] inline

namespace raster::avx2 {

using Vector = __m256i; // eight pixels
constexpr std::int64_t lanes = 8;
constexpr std::int64_t vectorBytes = 32;

KX_AVX2_INLINE Vector firstLanes(std::int64_t count) {
    return _mm256_cmpgt_epi32(_mm256_set1_epi32(static_cast<int>(count)),
                              _mm256_setr_epi32(0, 1, 2, 3, 4, 5, 6, 7));
}

/// Eight pixels, or the first `left` if there are fewer: no other is touched, and the rest of the vector is
/// 0.
KX_AVX2_INLINE Vector loadPixels(const std::uint8_t* from, std::int64_t left) {
    if (left >= lanes) return _mm256_loadu_si256(reinterpret_cast<const Vector*>(from));
    return _mm256_maskload_epi32(reinterpret_cast<const int*>(from), firstLanes(left));
}

KX_AVX2_INLINE void storePixels(std::uint8_t* to, Vector pixels, std::int64_t left) {
    if (left >= lanes)
        _mm256_storeu_si256(reinterpret_cast<Vector*>(to), pixels);
    else
        _mm256_maskstore_epi32(reinterpret_cast<int*>(to), firstLanes(left), pixels);
}

KX_AVX2_INLINE void fill(std::uint8_t* to, std::uint32_t word, std::int64_t count) {
    const Vector pixels = _mm256_set1_epi32(static_cast<int>(word));
    for (; count >= lanes; count -= lanes, to += vectorBytes)
        storePixels(to, pixels, lanes);
    for (; count > 0; --count, to += 4)
        store(to, word);
}

/// Eight positions of an enlargement, relative to the pixel at the first one; they span eight pixels at most.
struct Ramp {
    Vector steps;
    KX_AVX2 explicit Ramp(std::uint32_t step)
        : steps(_mm256_mullo_epi32(_mm256_set1_epi32(static_cast<int>(step)),
                                   _mm256_setr_epi32(0, 1, 2, 3, 4, 5, 6, 7))) {}
    KX_AVX2 Vector at(std::int64_t position) const {
        return _mm256_add_epi32(steps, _mm256_set1_epi32(static_cast<int>(position & 0xFFFF)));
    }
};

void permute(const RasterBlock& block, const std::uint8_t* from, std::ptrdiff_t fromBytesPerRow,
             const RasterChannelMap& map);
void premultiply(std::uint8_t* pixels, std::size_t count, int alphaByte);
void unpremultiply(std::uint8_t* pixels, std::size_t count, int alphaByte);
void multiply(std::uint8_t* to, RasterLayout toLayout, const std::uint8_t* from, RasterLayout fromLayout,
              std::size_t count);
void blend(RasterRows<std::uint8_t> to, const std::uint8_t* a, const std::uint8_t* b,
           std::span<const std::uint8_t> weights, std::size_t count);
void planLinear(LinearPlan& plan);
void sampleLinear(std::uint8_t* to, const std::uint8_t* from, const LinearPlan& plan);
void sampleBox(RasterRows<std::uint8_t> to, RasterRows<const std::uint8_t> from, std::size_t rows,
               Sampling sampling, std::size_t count);
void averageRows(std::uint8_t* to, const std::uint8_t* const* rows, const BoxRun& run, std::uint32_t step,
                 std::size_t count);

} // namespace raster::avx2
