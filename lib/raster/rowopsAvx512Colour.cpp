#include "lib/raster/avx512.h"
#include "lib/raster/rasterops.h"
#include "lib/raster/rowops.h"

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace raster::avx512 {

namespace {

/// The same bytes for each pixel: byte i comes from map[i], or is 0 for 128.
KX_AVX512 inline Vector shuffleOf(const RasterChannelMap& map) {
    std::uint32_t word = 0;
    std::memcpy(&word, &map, sizeof word);
    return _mm512_add_epi8(_mm512_set1_epi32(static_cast<int>(word)),
                           _mm512_broadcast_i32x4(_mm_setr_epi32(0, 0x04040404, 0x08080808, 0x0C0C0C0C)));
}

/// A pixel's alpha as a word beside its even channels, and beside its odd ones.
KX_AVX512 inline Vector alphaWords(int alphaByte) {
    const auto alpha = static_cast<std::uint8_t>(alphaByte);
    return shuffleOf({alpha, 128, alpha, 128});
}

KX_AVX512 inline Vector alphaBytes(int alphaByte) {
    return _mm512_set1_epi32(static_cast<int>(0xFFU << (alphaByte * 8)));
}

/// (a * b + 127) / 255, exactly; `a` itself where `which` is not set.
KX_AVX512 inline Vector scaled(Vector a, Vector b, __mmask32 which = 0xFFFFFFFF) {
    const Vector more = _mm512_add_epi16(_mm512_mullo_epi16(a, b), _mm512_set1_epi16(128));
    return _mm512_mask_mulhi_epu16(a, which, more, _mm512_set1_epi16(257));
}

KX_AVX512 void permuteRow(std::uint8_t* to, const std::uint8_t* from, std::int64_t left, Vector shuffle) {
    constexpr std::int64_t ahead = 2048; // bytes of the destination, which come from memory as well
    // Stores at a vector's boundary never cross two cache lines.
    const auto toBoundary =
        static_cast<std::int64_t>(-reinterpret_cast<std::uintptr_t>(to) % vectorBytes) / 4;
    if (left >= 8 * lanes && toBoundary > 0) {
        storePixels(to, _mm512_shuffle_epi8(loadPixels(from, toBoundary), shuffle), toBoundary);
        to += toBoundary * 4;
        from += toBoundary * 4;
        left -= toBoundary;
    }
#pragma GCC unroll 4
    for (; left >= lanes; left -= lanes, to += vectorBytes, from += vectorBytes) {
        __builtin_prefetch(to + ahead, 1);
        storePixels(to, _mm512_shuffle_epi8(loadPixels(from, lanes), shuffle), lanes);
    }
    if (left > 0) storePixels(to, _mm512_shuffle_epi8(loadPixels(from, left), shuffle), left);
}

struct Premultiplication {
    Vector alphas;
    __mmask32 evenColours;
    __mmask32 oddColours;
    KX_AVX512 explicit Premultiplication(int alphaByte)
        : alphas(alphaWords(alphaByte))
        , evenColours(alphaByte == 0 ? 0xAAAAAAAA : 0xFFFFFFFF)
        , oddColours(alphaByte == 0 ? 0xFFFFFFFF : 0x55555555) {}
    KX_AVX512 Vector operator()(Vector pixels) const {
        const Vector alpha = _mm512_shuffle_epi8(pixels, alphas);
        return fromWords(scaled(evenWords(pixels), alpha, evenColours),
                         scaled(oddWords(pixels), alpha, oddColours));
    }
};

template <bool Premultiplied>
KX_AVX512 void multiplyRow(std::uint8_t* to, int alphaByte, const std::uint8_t* from, Vector shuffle,
                           std::int64_t left) {
    const Vector alphas = alphaWords(alphaByte);
    const Vector colours = _mm512_xor_si512(alphaBytes(alphaByte), _mm512_set1_epi8(-1));
    for (; left > 0; left -= lanes, to += vectorBytes, from += vectorBytes) {
        const Vector badge = _mm512_shuffle_epi8(loadPixels(from, left), shuffle);
        const Vector alpha = _mm512_shuffle_epi8(badge, alphas);
        Vector even = evenWords(badge);
        Vector odd = oddWords(badge);
        // What the badge takes away; of alpha itself, nothing.
        if constexpr (Premultiplied) {
            even = _mm512_subs_epu16(alpha, even);
            odd = _mm512_subs_epu16(alpha, odd);
        } else {
            // alpha - round(s * alpha / 255) is round((255 - s) * alpha / 255).
            const Vector dark = _mm512_andnot_si512(badge, colours);
            even = scaled(evenWords(dark), alpha);
            odd = scaled(oddWords(dark), alpha);
        }
        const Vector target = loadPixels(to, left);
        const Vector less = fromWords(scaled(evenWords(target), even), scaled(oddWords(target), odd));
        storePixels(to, _mm512_sub_epi8(target, less), left);
    }
}

} // namespace

KX_AVX512 void permute(const RasterBlock& block, const std::uint8_t* from, std::ptrdiff_t fromBytesPerRow,
                       const RasterChannelMap& map) {
    // Short rows do not pay for wide vectors.
    if (block.width < 4 * lanes) return avx2::rowOps.permute(block, from, fromBytesPerRow, map);
    const Vector shuffle = shuffleOf(map);
    std::uint8_t* to = block.data;
    for (std::size_t y = 0; y < block.height; ++y, to += block.bytesPerRow, from += fromBytesPerRow)
        permuteRow(to, from, static_cast<std::int64_t>(block.width), shuffle);
}

KX_AVX512 void premultiply(std::uint8_t* pixels, std::size_t count, int alphaByte) {
    const Premultiplication premultiplied(alphaByte);
    auto left = static_cast<std::int64_t>(count);
#pragma GCC unroll 4
    for (; left >= lanes; left -= lanes, pixels += vectorBytes)
        storePixels(pixels, premultiplied(loadPixels(pixels, lanes)), lanes);
    if (left > 0) storePixels(pixels, premultiplied(loadPixels(pixels, left)), left);
}

KX_AVX512 void multiply(std::uint8_t* to, RasterLayout toLayout, const std::uint8_t* from,
                        RasterLayout fromLayout, std::size_t count) {
    constexpr RasterChannelMap same{0, 1, 2, 3};
    const RasterChannelMap& map = toLayout.alphaFirst == fromLayout.alphaFirst ? same
                                  : toLayout.alphaFirst                        ? rasterRGBAToARGB
                                                                               : rasterARGBToRGBA;
    const auto row = fromLayout.premultiplied ? multiplyRow<true> : multiplyRow<false>;
    row(to, toLayout.alphaFirst ? 0 : 3, from, shuffleOf(map), static_cast<std::int64_t>(count));
}

} // namespace raster::avx512
