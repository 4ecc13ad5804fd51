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

/// (x + 127) / 255 for products of two bytes, exactly.
KX_AVX2_INLINE Vector dividedBy255(Vector products) {
    return _mm256_mulhi_epu16(_mm256_add_epi16(products, _mm256_set1_epi16(128)), _mm256_set1_epi16(257));
}

/// A pixel's alpha, as words, beside each of its channels: of pixels 0 and 1 and of pixels 2 and 3 of a lane.
struct AlphaWords {
    Vector low;
    Vector high;
    KX_AVX2 explicit AlphaWords(int alphaByte) {
        const long long unused = static_cast<long long>(0x8000800080008000ULL);
        const auto pixel = [](int byte) { return byte * 0x0001000100010001LL; };
        low = _mm256_set_epi64x(unused | pixel(4 + alphaByte), unused | pixel(alphaByte),
                                unused | pixel(4 + alphaByte), unused | pixel(alphaByte));
        high = _mm256_add_epi8(low, _mm256_set1_epi16(8));
    }
    KX_AVX2 Vector lowOf(Vector pixels) const { return _mm256_shuffle_epi8(pixels, low); }
    KX_AVX2 Vector highOf(Vector pixels) const { return _mm256_shuffle_epi8(pixels, high); }
};

KX_AVX2_INLINE Vector alphaBytes(int alphaByte) {
    return _mm256_set1_epi32(static_cast<int>(0xFFU << (alphaByte * 8)));
}

struct Premultiplication {
    AlphaWords alpha;
    Vector alphaMask;
    KX_AVX2 explicit Premultiplication(int alphaByte)
        : alpha(alphaByte)
        , alphaMask(alphaBytes(alphaByte)) {}
    KX_AVX2 Vector operator()(Vector pixels) const {
        // With 255 for alpha itself, its product with alpha is what it was.
        const Vector factors = _mm256_or_si256(pixels, alphaMask);
        const Vector low = dividedBy255(_mm256_mullo_epi16(lowWords(factors), alpha.lowOf(pixels)));
        const Vector high = dividedBy255(_mm256_mullo_epi16(highWords(factors), alpha.highOf(pixels)));
        return _mm256_packus_epi16(low, high);
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
        for (; at < inFours; at += 4 * vectorBytes)
            for (std::int64_t i = at; i < at + 4 * vectorBytes; i += vectorBytes)
                storePixels(to + i, _mm256_shuffle_epi8(loadPixels(from + i, lanes), shuffle), lanes);
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
KX_AVX2_INLINE void mapPixels(std::uint8_t* to, std::int64_t left, Vector alphaMask,
                              const Operation& operation) {
    const Vector pixels = loadPixels(to, left);
    if (_mm256_testnzc_si256(pixels, alphaMask))
        storePixels(to, operation(pixels), left);
    else if (!_mm256_testc_si256(pixels, alphaMask))
        storePixels(to, _mm256_setzero_si256(), left);
}

template <typename Operation>
KX_AVX2_INLINE void mapRow(std::uint8_t* to, std::size_t count, int alphaByte, const Operation& operation) {
    const Vector alphaMask = alphaBytes(alphaByte);
    auto left = static_cast<std::int64_t>(count);
    for (; left >= lanes; left -= lanes, to += vectorBytes)
        mapPixels(to, lanes, alphaMask, operation);
    if (left > 0) mapPixels(to, left, alphaMask, operation);
}

/// Badge pixels already stand in the target's layout.
template <bool Premultiplied>
struct Multiplication {
    AlphaWords alpha;
    Vector alphaMask;
    KX_AVX2 explicit Multiplication(int alphaByte)
        : alpha(alphaByte)
        , alphaMask(alphaBytes(alphaByte)) {}

    KX_AVX2 static Vector darkness(Vector words, Vector alphas) {
        if constexpr (Premultiplied)
            return _mm256_subs_epu16(alphas, words);
        else
            return dividedBy255(_mm256_mullo_epi16(words, alphas));
    }
    KX_AVX2 Vector operator()(Vector target, Vector badge) const {
        // Straight colours: alpha - round(s * a / 255) is round((255 - s) * a / 255). Alpha's own byte comes
        // to 0.
        const Vector factors =
            Premultiplied ? badge
                          : _mm256_andnot_si256(badge, _mm256_xor_si256(alphaMask, _mm256_set1_epi8(-1)));
        const Vector low = darkness(lowWords(factors), alpha.lowOf(badge));
        const Vector high = darkness(highWords(factors), alpha.highOf(badge));
        const Vector less = _mm256_packus_epi16(dividedBy255(_mm256_mullo_epi16(lowWords(target), low)),
                                                dividedBy255(_mm256_mullo_epi16(highWords(target), high)));
        return _mm256_sub_epi8(target, less);
    }
};

template <bool Premultiplied>
KX_AVX2 void multiplyRow(std::uint8_t* to, RasterLayout toLayout, const std::uint8_t* from, bool alphaFirst,
                         std::size_t count) {
    constexpr RasterChannelMap same{0, 1, 2, 3};
    const RasterChannelMap& map = toLayout.alphaFirst == alphaFirst ? same
                                  : toLayout.alphaFirst             ? rasterRGBAToARGB
                                                                    : rasterARGBToRGBA;
    const Vector shuffle = shuffleOf(map);
    const Multiplication<Premultiplied> times(toLayout.alphaFirst ? 0 : 3);
    for (auto left = static_cast<std::int64_t>(count); left > 0;
         left -= lanes, to += vectorBytes, from += vectorBytes) {
        const Vector badge = _mm256_shuffle_epi8(loadPixels(from, left), shuffle);
        storePixels(to, times(loadPixels(to, left), badge), left);
    }
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
    const auto row = fromLayout.premultiplied ? multiplyRow<true> : multiplyRow<false>;
    row(to, toLayout, from, fromLayout.alphaFirst, count);
}

} // namespace raster::avx2
