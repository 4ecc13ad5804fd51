#pragma once

#include "lib/raster/pixel.h"
#include "lib/raster/rowops.h"

#include <immintrin.h>

#define KX_AVX512 [[gnu::target("avx512f,avx512bw,avx512vl,avx512vbmi")]]

namespace raster::avx512 {

using Vector = __m512i; // sixteen pixels
constexpr std::int64_t lanes = 16;
constexpr std::int64_t vectorBytes = 64;

KX_AVX512 inline __mmask16 firstLanes(std::int64_t count) {
    return static_cast<__mmask16>(count >= lanes ? 0xFFFF : (1U << count) - 1);
}

/// Sixteen pixels, or the first `left` if there are fewer: no other is touched, and the rest of the vector is
/// 0.
KX_AVX512 inline Vector loadPixels(const std::uint8_t* from, std::int64_t left) {
    return left >= lanes ? _mm512_loadu_si512(from) : _mm512_maskz_loadu_epi32(firstLanes(left), from);
}

KX_AVX512 inline void storePixels(std::uint8_t* to, Vector pixels, std::int64_t left) {
    if (left >= lanes)
        _mm512_storeu_si512(to, pixels);
    else
        _mm512_mask_storeu_epi32(to, firstLanes(left), pixels);
}

/// The channels as words: those at even places, and those at odd ones.
KX_AVX512 inline Vector evenWords(Vector pixels) {
    return _mm512_and_si512(pixels, _mm512_set1_epi16(0xFF));
}
KX_AVX512 inline Vector oddWords(Vector pixels) {
    return _mm512_srli_epi16(pixels, 8);
}
KX_AVX512 inline Vector fromWords(Vector even, Vector odd) {
    return _mm512_mask_alignr_epi8(even, 0xAAAAAAAAAAAAAAAA, odd, odd, 15); // each odd byte one place up
}

/// 0, 1, 2 ... times `step`.
KX_AVX512 inline Vector ramp(std::uint32_t step) {
    const Vector places = _mm512_setr_epi32(0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15);
    return _mm512_mullo_epi32(_mm512_set1_epi32(static_cast<int>(step)), places);
}

void permute(const RasterBlock& block, const std::uint8_t* from, std::ptrdiff_t fromBytesPerRow,
             const RasterChannelMap& map);
void premultiply(std::uint8_t* pixels, std::size_t count, int alphaByte);
void multiply(std::uint8_t* to, RasterLayout toLayout, const std::uint8_t* from, RasterLayout fromLayout,
              std::size_t count);

} // namespace raster::avx512
