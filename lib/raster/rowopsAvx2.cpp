#include "lib/raster/avx2.h"
#include "lib/raster/pixel.h"
#include "lib/raster/rowops.h"

#include <algorithm>
#include <bit>
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

/// floor(sum * 65536 / step): exact, since half a unit of the sum's 65536 parts outweighs every rounding.
struct Average {
    __m256d factor;
    int shift; ///< what divides as well, if the step is 2, 4, 8, 16 or 32 whole pixels; else 0
    KX_AVX2 explicit Average(std::uint32_t step)
        : factor(_mm256_set1_pd(65536.0 / step))
        , shift(std::has_single_bit(step) && step <= 0x200000 ? std::countr_zero(step) - 16 : 0) {}
    KX_AVX2 __m128i operator()(__m128i sums) const {
        const __m256d more = _mm256_add_pd(_mm256_cvtepi32_pd(sums), _mm256_set1_pd(0.5 / 65536));
        return _mm256_cvttpd_epi32(_mm256_mul_pd(more, factor));
    }
    KX_AVX2 Vector operator()(Vector sums) const {
        return _mm256_set_m128i((*this)(_mm256_extracti128_si256(sums, 1)),
                                (*this)(_mm256_castsi256_si128(sums)));
    }
};

/// Each channel of a pixel * weight >> 8, as 32-bit numbers.
KX_AVX2 inline __m128i weighted(const std::uint8_t* pixel, std::uint32_t weight) {
    const __m128i channels = _mm_cvtepu8_epi32(_mm_cvtsi32_si128(static_cast<int>(load(pixel))));
    return _mm_srli_epi32(_mm_mullo_epi16(channels, _mm_set1_epi32(static_cast<int>(weight))), 8);
}

/// The sum by channels, in each half, of four whole pixels: c * 255 >> 8 is c - 1, and 0 for 0.
KX_AVX2 inline Vector wholePixels(Vector pixels) {
    const Vector byChannel =
        _mm256_broadcastsi128_si256(_mm_setr_epi8(0, 4, 8, 12, 1, 5, 9, 13, 2, 6, 10, 14, 3, 7, 11, 15));
    const Vector values = _mm256_shuffle_epi8(_mm256_subs_epu8(pixels, _mm256_set1_epi8(1)), byChannel);
    return _mm256_madd_epi16(_mm256_maddubs_epi16(values, _mm256_set1_epi8(1)), _mm256_set1_epi16(1));
}

/// The sum of one box that lies within the row.
KX_AVX2 inline __m128i boxSum(const std::uint8_t* from, std::int64_t position, std::uint32_t step) {
    const std::uint8_t* pixel = from + (position >> 16) * 4;
    __m128i sum = _mm_setzero_si128();
    std::uint32_t remaining = step;
    std::uint32_t room = BoxRun::maximum;
    if (const auto part = static_cast<std::uint32_t>((0x10000 - (position & 0xFFFF)) & 0xFFFF); part != 0) {
        sum = weighted(pixel, part >> 8);
        pixel += 4;
        remaining -= part;
        --room;
    }
    const std::uint32_t whole = std::min(remaining >> 16, room);
    Vector sums = _mm256_setzero_si256();
    for (auto left = static_cast<std::int64_t>(whole); left > 0; left -= lanes, pixel += vectorBytes)
        sums = _mm256_add_epi32(sums, wholePixels(loadPixels(pixel, left)));
    sum = _mm_add_epi32(sum, _mm_add_epi32(_mm256_castsi256_si128(sums), _mm256_extracti128_si256(sums, 1)));
    const std::uint32_t part = remaining & 0xFFFF;
    if (whole == room || part == 0) return sum;
    const std::uint8_t* const end = from + ((position + step) >> 16) * 4;
    return _mm_add_epi32(sum, weighted(end, part >> 8));
}

/// Sums by channel, as words, of each pixel at an even place and its right neighbour.
KX_AVX2 inline Vector pairSums(const std::uint8_t* from) {
    const Vector byPair =
        _mm256_broadcastsi128_si256(_mm_setr_epi8(0, 4, 1, 5, 2, 6, 3, 7, 8, 12, 9, 13, 10, 14, 11, 15));
    const Vector values = _mm256_subs_epu8(loadPixels(from, lanes), _mm256_set1_epi8(1));
    return _mm256_maddubs_epi16(_mm256_shuffle_epi8(values, byPair), _mm256_set1_epi8(1));
}

KX_AVX2 inline Vector quadSums(const std::uint8_t* from) {
    const Vector left = pairSums(from);
    const Vector right = pairSums(from + vectorBytes);
    return _mm256_add_epi16(_mm256_unpacklo_epi64(left, right), _mm256_unpackhi_epi64(left, right));
}

/// Boxes of exactly two or four whole pixels, eight at a time. Returns how many it has done.
KX_AVX2 std::int64_t halveOrQuarter(std::uint8_t* to, const std::uint8_t* from, const Sampling& s,
                                    std::int64_t count) {
    const bool quarter = s.step == 0x40000;
    if ((!quarter && s.step != 0x20000) || (s.position & 0xFFFF) != 0) return 0;
    const Vector inOrder = _mm256_setr_epi32(0, 4, 1, 5, 2, 6, 3, 7);
    const std::uint8_t* pixel = from + (s.position >> 16) * 4;
    std::int64_t x = 0;
    for (; x + lanes <= count; x += lanes) {
        Vector boxes;
        if (quarter) {
            const Vector low = _mm256_srli_epi16(quadSums(pixel), 2);
            const Vector high = _mm256_srli_epi16(quadSums(pixel + 2 * vectorBytes), 2);
            boxes = _mm256_permutevar8x32_epi32(_mm256_packus_epi16(low, high), inOrder);
            pixel += 4 * vectorBytes;
        } else {
            const Vector low = _mm256_srli_epi16(pairSums(pixel), 1);
            const Vector high = _mm256_srli_epi16(pairSums(pixel + vectorBytes), 1);
            boxes = _mm256_permute4x64_epi64(_mm256_packus_epi16(low, high), 0xD8);
            pixel += 2 * vectorBytes;
        }
        storePixels(to + x * 4, boxes, lanes);
    }
    return x;
}

KX_AVX2 void sampleBox(std::uint8_t* to, const std::uint8_t* from, Sampling s, std::size_t count) {
    const Average average(s.step);
    const std::int64_t room = (std::int64_t{s.sourceCount} << 16) - s.position;
    const std::int64_t within =
        s.position < 0 ? 0 : std::min(static_cast<std::int64_t>(count), room / s.step);
    std::int64_t x = halveOrQuarter(to, from, s, within);
    for (; x < within; ++x) {
        const __m128i channels = average(boxSum(from, s.position + x * s.step, s.step));
        const __m128i words = _mm_packus_epi32(channels, channels);
        store(to + x * 4, static_cast<std::uint32_t>(_mm_cvtsi128_si32(_mm_packus_epi16(words, words))));
    }
    x = std::max<std::int64_t>(x, 0);
    s.position += x * s.step;
    scalarRowOps.sampleBox(to + x * 4, from, s, count - static_cast<std::size_t>(x));
}

/// Sums of eight pixels by channel in words: at most 32 * 254.
struct RowSums {
    Vector low;
    Vector high;

    KX_AVX2 RowSums()
        : low(_mm256_setzero_si256())
        , high(_mm256_setzero_si256()) {}
    KX_AVX2 void add(Vector pixels, std::uint8_t weight) {
        if (weight == 255) {
            const Vector less = _mm256_subs_epu8(pixels, _mm256_set1_epi8(1));
            low = _mm256_add_epi16(low, lowWords(less));
            high = _mm256_add_epi16(high, highWords(less));
            return;
        }
        const Vector weights = _mm256_set1_epi16(weight);
        low = _mm256_add_epi16(low, _mm256_srli_epi16(_mm256_mullo_epi16(lowWords(pixels), weights), 8));
        high = _mm256_add_epi16(high, _mm256_srli_epi16(_mm256_mullo_epi16(highWords(pixels), weights), 8));
    }
    KX_AVX2 static Vector averageWords(Vector words, const Average& average) {
        const Vector zero = _mm256_setzero_si256();
        return _mm256_packus_epi32(average(_mm256_unpacklo_epi16(words, zero)),
                                   average(_mm256_unpackhi_epi16(words, zero)));
    }
    KX_AVX2 Vector averaged(const Average& average) const {
        if (average.shift > 0) {
            const __m128i by = _mm_cvtsi32_si128(average.shift);
            return _mm256_packus_epi16(_mm256_srl_epi16(low, by), _mm256_srl_epi16(high, by));
        }
        return _mm256_packus_epi16(averageWords(low, average), averageWords(high, average));
    }
};

KX_AVX2 void averageRows(std::uint8_t* to, const std::uint8_t* const* rows, const BoxRun& run,
                         std::uint32_t step, std::size_t count) {
    const Average average(step);
    std::size_t at = 0;
    for (auto left = static_cast<std::int64_t>(count); left > 0; left -= lanes, at += vectorBytes) {
        RowSums sums;
        for (int i = 0; i < run.count; ++i)
            sums.add(loadPixels(rows[i] + at, left), run.weights[i]);
        storePixels(to + at, sums.averaged(average), left);
    }
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
