#include "lib/raster/avx2.h"
#include "lib/raster/rasterops.h"

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace raster::avx2 {

namespace {

/// The same bytes for each of the four pixels of a lane: byte i comes from map[i].
KX_AVX2_INLINE Vector shuffleOf(const RasterChannelMap& map) {
    std::uint32_t word = 0;
    std::memcpy(&word, &map, sizeof word);
    const Vector pixel = _mm256_set1_epi32(static_cast<int>(word));
    return _mm256_add_epi8(pixel, _mm256_set_epi32(0x0C0C0C0C, 0x08080808, 0x04040404, 0, 0x0C0C0C0C,
                                                   0x08080808, 0x04040404, 0));
}

/// The channels as words: those at even places, and those at odd ones.
KX_AVX2_INLINE Vector evenWords(Vector pixels) {
    return _mm256_and_si256(pixels, _mm256_set1_epi16(0xFF));
}
KX_AVX2_INLINE Vector oddWords(Vector pixels) {
    return _mm256_srli_epi16(pixels, 8);
}
KX_AVX2_INLINE Vector fromWords(Vector even, Vector odd) {
    return _mm256_or_si256(even, _mm256_slli_epi16(odd, 8));
}
/// A pixel's alpha as a word beside its even channels, and beside its odd ones.
KX_AVX2_INLINE Vector alphaWords(int alphaByte) {
    const auto alpha = static_cast<std::uint8_t>(alphaByte);
    return _mm256_or_si256(shuffleOf({alpha, 0, alpha, 0}), _mm256_set1_epi16(static_cast<short>(0x8000)));
}

/// (x + 127) / 255 for products of two bytes, exactly.
KX_AVX2_INLINE Vector dividedBy255(Vector products) {
    return _mm256_mulhi_epu16(_mm256_add_epi16(products, _mm256_set1_epi16(128)), _mm256_set1_epi16(257));
}
/// 255 less that.
KX_AVX2_INLINE Vector restOf255(Vector products) {
    return _mm256_mulhi_epu16(
        _mm256_sub_epi16(_mm256_set1_epi16(static_cast<short>(255 * 255 + 128)), products),
        _mm256_set1_epi16(257));
}

KX_AVX2_INLINE Vector alphaBytes(int alphaByte) {
    return _mm256_set1_epi32(static_cast<int>(0xFFU << (alphaByte * 8)));
}

struct Premultiplication {
    Vector alphas;
    Vector alphaMask;
    KX_AVX2 explicit Premultiplication(int alphaByte)
        : alphas(alphaWords(alphaByte))
        , alphaMask(alphaBytes(alphaByte)) {}
    KX_AVX2_INLINE Vector operator()(Vector pixels) const {
        // With 255 for alpha itself, its product with alpha is what it was.
        const Vector factors = _mm256_or_si256(pixels, alphaMask);
        const Vector alpha = _mm256_shuffle_epi8(pixels, alphas);
        return fromWords(dividedBy255(_mm256_mullo_epi16(evenWords(factors), alpha)),
                         dividedBy255(_mm256_mullo_epi16(oddWords(factors), alpha)));
    }
};

/// floor((c * 255 + alpha / 2) / alpha) is c * 255 / alpha, rounded, halves up. A product lies on a half or
/// at least 1 / 510 away from it: 2^-19 more of it lifts the halves, and no other. Alpha 0 gives infinity or
/// no number at all, which converts to the smallest integer and saturates to 0.
struct Unpremultiplication {
    Vector channels[3];
    Vector alphaChannel;
    Vector transposed;

    KX_AVX2 explicit Unpremultiplication(int alphaByte) {
        const int colour = alphaByte == 0 ? 1 : 0;
        for (int i = 0; i < 3; ++i)
            channels[i] = channel(colour + i);
        alphaChannel = channel(alphaByte);
        transposed = alphaByte == 0 ? ofPixel(0x0804000C) : ofPixel(0x0C080400);
    }
    KX_AVX2 Vector operator()(Vector pixels) const {
        const Vector alpha = _mm256_shuffle_epi8(pixels, alphaChannel);
        const __m256 scale =
            _mm256_div_ps(_mm256_set1_ps(255 + 255.0F / (1 << 19)), _mm256_cvtepi32_ps(alpha));
        const Vector first = straight(_mm256_shuffle_epi8(pixels, channels[0]), scale);
        const Vector second = straight(_mm256_shuffle_epi8(pixels, channels[1]), scale);
        const Vector third = straight(_mm256_shuffle_epi8(pixels, channels[2]), scale);
        const Vector bytes =
            _mm256_packus_epi16(_mm256_packs_epi32(first, second), _mm256_packs_epi32(third, alpha));
        return _mm256_shuffle_epi8(bytes, transposed);
    }

private:
    /// Byte `byte` of each pixel as a number.
    KX_AVX2 static Vector channel(int byte) {
        const int unused = static_cast<int>(0x80808000U);
        const __m128i half =
            _mm_setr_epi32(unused | byte, unused | (byte + 4), unused | (byte + 8), unused | (byte + 12));
        return _mm256_broadcastsi128_si256(half);
    }
    /// The shuffle from four bytes of each channel to four pixels, of which this is the first.
    KX_AVX2 static Vector ofPixel(int first) {
        const __m128i half =
            _mm_add_epi8(_mm_set1_epi32(first), _mm_setr_epi32(0, 0x01010101, 0x02020202, 0x03030303));
        return _mm256_broadcastsi128_si256(half);
    }
    KX_AVX2 static Vector straight(Vector values, __m256 scale) {
        return _mm256_cvtps_epi32(_mm256_mul_ps(_mm256_cvtepi32_ps(values), scale));
    }
};

/// Writes pixels until the destination stands at a vector's boundary, where no store crosses two cache lines;
/// the bytes written. None when no whole number of pixels leads there.
KX_AVX2_INLINE std::int64_t storeUpToBoundary(std::uint8_t* to, const std::uint8_t* from, Vector shuffle) {
    const auto bytes = static_cast<std::int64_t>(-reinterpret_cast<std::uintptr_t>(to) % vectorBytes);
    if (bytes == 0 || bytes % 4 != 0) return 0;
    storePixels(to, _mm256_shuffle_epi8(loadPixels(from, bytes / 4), shuffle), bytes / 4);
    return bytes;
}

KX_AVX2 void permuteRows(const RasterBlock& block, const std::uint8_t* from, std::ptrdiff_t fromBytesPerRow,
                         Vector shuffle) {
    const auto rowBytes = static_cast<std::int64_t>(block.width * 4);
    std::uint8_t* to = block.data;
    for (std::size_t y = 0; y < block.height; ++y, to += block.bytesPerRow, from += fromBytesPerRow) {
        std::int64_t at = rowBytes >= 16 * vectorBytes ? storeUpToBoundary(to, from, shuffle) : 0;
        const std::int64_t inFours = at + ((rowBytes - at) & -4 * vectorBytes);
        for (; at < inFours; at += 4 * vectorBytes) {
            // Where a loop of one vector would stand in memory matters by a fifth.
#pragma GCC unroll 4
            for (int i = 0; i < 4; ++i)
                storePixels(to + at + i * vectorBytes,
                            _mm256_shuffle_epi8(loadPixels(from + at + i * vectorBytes, lanes), shuffle),
                            lanes);
        }
        for (std::int64_t left = (rowBytes - at) / 4; left > 0; left -= lanes, at += vectorBytes)
            storePixels(to + at, _mm256_shuffle_epi8(loadPixels(from + at, left), shuffle), left);
    }
}

/// The rows of the usual icons, as many vectors each, leave no room for loops within them.
template <int Vectors>
KX_AVX2 void permuteShortRows(const RasterBlock& block, const std::uint8_t* from,
                              std::ptrdiff_t fromBytesPerRow, Vector shuffle) {
    std::uint8_t* to = block.data;
    for (std::size_t y = 0; y < block.height; ++y, to += block.bytesPerRow, from += fromBytesPerRow) {
#pragma GCC unroll 8
        for (int i = 0; i < Vectors; ++i)
            storePixels(to + i * vectorBytes,
                        _mm256_shuffle_epi8(loadPixels(from + i * vectorBytes, lanes), shuffle), lanes);
    }
}

/// Pixels that are all opaque stay as they are, and those that are all clear become 0: most of an icon.
template <typename Operation>
KX_AVX2_INLINE void mapPixels(std::uint8_t* to, std::int64_t left, int alphaByte, Vector alphaMask,
                              const Operation& operation) {
    const Vector pixels = loadPixels(to, left);
    if (_mm256_testnzc_si256(pixels, alphaMask))
        storePixels(to, operation(pixels), left);
    else if (to[alphaByte] == 0)
        storePixels(to, _mm256_setzero_si256(), left);
}

template <typename Operation>
KX_AVX2_INLINE void mapRow(std::uint8_t* to, std::size_t count, int alphaByte, const Operation& operation) {
    const Vector alphaMask = alphaBytes(alphaByte);
    auto left = static_cast<std::int64_t>(count);
    for (; left >= 2 * lanes; left -= 2 * lanes, to += 2 * vectorBytes) {
        mapPixels(to, lanes, alphaByte, alphaMask, operation);
        mapPixels(to + vectorBytes, lanes, alphaByte, alphaMask, operation);
    }
    for (; left > 0; left -= lanes, to += vectorBytes)
        mapPixels(to, left, alphaByte, alphaMask, operation);
}

/// Where a target's even and odd channels stand in the badge, and its alpha for both, as words. Alpha is none
/// of the channels.
struct BadgeWords {
    Vector even;
    Vector odd;
    Vector alphas;
    KX_AVX2 BadgeWords(bool toAlphaFirst, bool alphaFirst) {
        const std::uint8_t first = alphaFirst ? 1 : 0;
        const auto second = static_cast<std::uint8_t>(first + 1);
        const auto third = static_cast<std::uint8_t>(first + 2);
        even = toAlphaFirst ? wordsAt(none, second) : wordsAt(first, third);
        odd = toAlphaFirst ? wordsAt(first, third) : wordsAt(second, none);
        const std::uint8_t alpha = alphaFirst ? 0 : 3;
        alphas = wordsAt(alpha, alpha);
    }

private:
    static constexpr std::uint8_t none = 0x80;
    KX_AVX2 static Vector wordsAt(std::uint8_t a, std::uint8_t b) { return shuffleOf({a, none, b, none}); }
};

/// What a badge leaves of the target's channels: of 255, all but round((255 - s) * a / 255) for straight
/// colours s, all but a - m for premultiplied ones m.
template <bool Premultiplied>
struct Multiplication {
    BadgeWords words;

    KX_AVX2_INLINE static Vector light(Vector dark, Vector alpha) {
        if constexpr (Premultiplied) {
            const Vector all = _mm256_set1_epi16(255);
            const Vector clear = _mm256_sub_epi16(all, alpha);
            return _mm256_sub_epi16(all, _mm256_subs_epu16(dark, clear));
        } else {
            return restOf255(_mm256_mullo_epi16(dark, alpha));
        }
    }
    KX_AVX2_INLINE Vector operator()(Vector target, Vector badge) const {
        const Vector dark = _mm256_xor_si256(badge, _mm256_set1_epi8(-1));
        const Vector alpha = _mm256_shuffle_epi8(badge, words.alphas);
        const Vector even = light(_mm256_shuffle_epi8(dark, words.even), alpha);
        const Vector odd = light(_mm256_shuffle_epi8(dark, words.odd), alpha);
        // t - round(t * d / 255) is round(t * (255 - d) / 255).
        return fromWords(dividedBy255(_mm256_mullo_epi16(evenWords(target), even)),
                         dividedBy255(_mm256_mullo_epi16(oddWords(target), odd)));
    }
};

template <bool Premultiplied>
KX_AVX2 void multiplyRow(std::uint8_t* to, const std::uint8_t* from,
                         const Multiplication<Premultiplied>& times, std::int64_t left) {
    for (; left >= lanes; left -= lanes, to += vectorBytes, from += vectorBytes)
        storePixels(to, times(loadPixels(to, lanes), loadPixels(from, lanes)), lanes);
    if (left > 0) storePixels(to, times(loadPixels(to, left), loadPixels(from, left)), left);
}

} // namespace

KX_AVX2 void permute(const RasterBlock& block, const std::uint8_t* from, std::ptrdiff_t fromBytesPerRow,
                     const RasterChannelMap& map) {
    const Vector shuffle = shuffleOf(map);
    switch (block.width) {
    case 16:
        return permuteShortRows<2>(block, from, fromBytesPerRow, shuffle);
    case 32:
        return permuteShortRows<4>(block, from, fromBytesPerRow, shuffle);
    case 48:
        return permuteShortRows<6>(block, from, fromBytesPerRow, shuffle);
    default:
        return permuteRows(block, from, fromBytesPerRow, shuffle);
    }
}

KX_AVX2 void premultiply(std::uint8_t* pixels, std::size_t count, int alphaByte) {
    mapRow(pixels, count, alphaByte, Premultiplication(alphaByte));
}

KX_AVX2 void unpremultiply(std::uint8_t* pixels, std::size_t count, int alphaByte) {
    mapRow(pixels, count, alphaByte, Unpremultiplication(alphaByte));
}

KX_AVX2 void multiply(std::uint8_t* to, RasterLayout toLayout, const std::uint8_t* from,
                      RasterLayout fromLayout, std::size_t count) {
    const BadgeWords words(toLayout.alphaFirst, fromLayout.alphaFirst);
    const auto left = static_cast<std::int64_t>(count);
    if (fromLayout.premultiplied)
        multiplyRow(to, from, Multiplication<true>{words}, left);
    else
        multiplyRow(to, from, Multiplication<false>{words}, left);
}

} // namespace raster::avx2
