#include "lib/raster/avx512.h"
#include "lib/raster/pixel.h"
#include "lib/raster/rasterops.h"
#include "lib/raster/rowops.h"

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <span>

namespace raster::avx512 {

namespace {

/// From sums of pixels with flipped sign, weighted with 255 in all, to pixels: such a sum stays within a
/// signed word, and its rounded high byte is the result less 127.
KX_AVX512 inline Vector blended(Vector low, Vector high) {
    const Vector highByte = _mm512_set1_epi16(128);
    const Vector bytes =
        _mm512_packs_epi16(_mm512_mulhrs_epi16(low, highByte), _mm512_mulhrs_epi16(high, highByte));
    return _mm512_add_epi8(bytes, _mm512_set1_epi8(127));
}

KX_AVX512 inline Vector flipped(Vector pixels) {
    return _mm512_xor_si512(pixels, _mm512_set1_epi8(-128));
}

/// Sixteen pixels, or the first `left`, of each of `Rows` rows: what they have in common is done once.
template <int Rows>
KX_AVX512 inline void blendPixels(RasterRows<std::uint8_t> to, Vector a, Vector b, const Vector* weights,
                                  std::int64_t left) {
    const Vector low = _mm512_unpacklo_epi8(flipped(a), flipped(b));
    const Vector high = _mm512_unpackhi_epi8(flipped(a), flipped(b));
#pragma GCC unroll 4
    for (int row = 0; row < Rows; ++row)
        storePixels(
            to.data + row * to.bytesPerRow,
            blended(_mm512_maddubs_epi16(weights[row], low), _mm512_maddubs_epi16(weights[row], high)), left);
}

template <int Rows>
KX_AVX512 void blendRows(RasterRows<std::uint8_t> to, const std::uint8_t* a, const std::uint8_t* b,
                         const std::uint8_t* weights, std::int64_t left) {
    // 255 - w in the low byte and w above it.
    Vector pairs[Rows];
    for (int row = 0; row < Rows; ++row)
        pairs[row] = _mm512_set1_epi16(static_cast<short>(weights[row] * 255 + 255));
    for (; left >= lanes; left -= lanes, to.data += vectorBytes, a += vectorBytes, b += vectorBytes)
        blendPixels<Rows>(to, loadPixels(a, lanes), loadPixels(b, lanes), pairs, lanes);
    if (left > 0) blendPixels<Rows>(to, loadPixels(a, left), loadPixels(b, left), pairs, left);
}

KX_AVX512 void blend(RasterRows<std::uint8_t> to, const std::uint8_t* a, const std::uint8_t* b,
                     std::span<const std::uint8_t> weights, std::size_t count) {
    static constexpr decltype(&blendRows<1>) byNumber[] = {blendRows<1>, blendRows<2>, blendRows<3>,
                                                           blendRows<4>};
    byNumber[weights.size() - 1](to, a, b, weights.data(), static_cast<std::int64_t>(count));
}

KX_AVX512 void fill(std::uint8_t* to, std::uint32_t word, std::int64_t count) {
    for (; count > 0; count -= lanes, to += vectorBytes)
        storePixels(to, _mm512_set1_epi32(static_cast<int>(word)), count);
}

/// Which two neighbours make each of eight pixels, and with which weights; both depend on the fraction of the
/// first position only. The eight are 0, 1, 4, 5, 8, 9, 12 and 13, and span at most fifteen source pixels.
class Taps {
public:
    /// For positions from 0 on. The low half is the left neighbour's position, the high one the right one's.
    KX_AVX512 static Vector rampOf(std::uint32_t step) {
        const Vector places = _mm512_setr_epi64(0, 1, 4, 5, 8, 9, 12, 13);
        const Vector left = _mm512_mullo_epi32(_mm512_set1_epi64(step), places);
        return _mm512_add_epi64(_mm512_or_si512(left, _mm512_slli_epi64(left, 32)),
                                _mm512_set1_epi64(0x10000LL << 32));
    }
    KX_AVX512 Taps(Vector ramp, std::int64_t position) {
        const Vector at = _mm512_add_epi64(ramp, _mm512_set1_epi64((position & 0xFFFF) * 0x100000001LL));
        // Of a qword, the byte from each of these bits on: 4 times the place, and the weight.
        const Vector places = _mm512_multishift_epi64_epi8(_mm512_set1_epi64(0x2E0E2E0E2E0E2E0E), at);
        const Vector weights = _mm512_multishift_epi64_epi8(_mm512_set1_epi64(0x0808080808080808), at);
        constexpr int firstAndSecondOrThird = 0xEA;
        m_bytes = _mm512_ternarylogic_epi64(places, _mm512_set1_epi8(-4),
                                            _mm512_set1_epi64(0x0303020201010000), firstAndSecondOrThird);
        m_weights = _mm512_xor_si512(weights, _mm512_set1_epi16(0xFF));
    }
    KX_AVX512 Vector sums(Vector pixels) const {
        return _mm512_maddubs_epi16(m_weights, _mm512_permutexvar_epi8(m_bytes, flipped(pixels)));
    }

private:
    Vector m_bytes;
    Vector m_weights;
};

/// Of each four pixels the first two come from one half of the sums, the last two from the other.
KX_AVX512 void enlargeLinear(std::uint8_t* to, const std::uint8_t* from, Sampling s, std::int64_t count) {
    const Vector ramp = Taps::rampOf(s.step);
    const std::int64_t two = 2 * std::int64_t{s.step};
    Taps low(ramp, s.position);
    Taps high(ramp, s.position + two);
    // Steps of a power of two come back to the same fraction.
    const bool repeats = (lanes * s.step & 0xFFFF) == 0;
    for (; count > 0; count -= lanes, to += vectorBytes, s.position += lanes * s.step) {
        const std::int64_t second = s.position + two;
        if (!repeats) {
            low = Taps(ramp, s.position);
            high = Taps(ramp, second);
        }
        const std::int64_t lowIndex = s.position >> 16;
        const std::int64_t highIndex = std::min<std::int64_t>(second >> 16, s.sourceCount - 1);
        storePixels(to,
                    blended(low.sums(loadPixels(from + lowIndex * 4, s.sourceCount - lowIndex)),
                            high.sums(loadPixels(from + highIndex * 4, s.sourceCount - highIndex))),
                    count);
    }
}

KX_AVX512 void sampleLinear(std::uint8_t* to, const std::uint8_t* from, const LinearPlan& plan) {
    Sampling s = plan.sampling;
    const RowParts& parts = plan.parts;
    const std::uint32_t first = load(from);
    const std::uint32_t last = load(from + std::ptrdiff_t{s.sourceCount - 1} * 4);
    fill(to, blendWords(first, first, 0), parts.before);
    s.position += parts.before * s.step;
    enlargeLinear(to + parts.before * 4, from, s, parts.between);
    fill(to + (parts.before + parts.between) * 4, blendWords(last, last, 0), parts.after);
}

KX_AVX512 void reduceNearest(std::uint8_t* to, const std::uint8_t* from, Sampling s, std::int64_t count) {
    const Vector steps = ramp(s.step);
    for (; count > 0; count -= lanes, to += vectorBytes, s.position += lanes * s.step) {
        const Vector at = _mm512_add_epi32(steps, _mm512_set1_epi32(static_cast<int>(s.position & 0xFFFF)));
        storePixels(to,
                    _mm512_mask_i32gather_epi32(_mm512_setzero_si512(), firstLanes(count),
                                                _mm512_srli_epi32(at, 16), from + (s.position >> 16) * 4, 4),
                    count);
    }
}

KX_AVX512 void sampleNearest(std::uint8_t* to, const std::uint8_t* from, Sampling s, std::size_t count) {
    const RowParts parts(s, static_cast<std::int64_t>(count));
    if (s.step <= 0x10000 || parts.before > 0) return avx2::rowOps.sampleNearest(to, from, s, count);
    reduceNearest(to, from, s, parts.between);
    fill(to + parts.between * 4, load(from + std::ptrdiff_t{s.sourceCount - 1} * 4), parts.after);
}

/// floor(sum * 65536 / step) of words below 2^13. The reciprocal has 32 bits and is too large by less than
/// one of them, 2^shift above the result, which is less than the distance from any quotient to the next whole
/// one.
class Average {
public:
    KX_AVX512 explicit Average(std::uint32_t step) {
        const auto shift = static_cast<int>(std::bit_width(step - 1)) - 14;
        const std::uint64_t reciprocal = ((1ULL << (45 + shift)) + step - 1) / step;
        m_high = _mm512_set1_epi16(static_cast<short>(reciprocal >> 16));
        m_low = _mm512_set1_epi16(static_cast<short>(reciprocal & 0xFFFF));
        m_shift = _mm_cvtsi32_si128(shift);
    }
    KX_AVX512 Vector operator()(Vector sums) const {
        const Vector value = _mm512_slli_epi16(sums, 3);
        const Vector below = _mm512_mulhi_epu16(value, m_low);
        const Vector middle = _mm512_add_epi16(_mm512_mullo_epi16(value, m_high), below);
        const Vector above = _mm512_mulhi_epu16(value, m_high);
        const __mmask32 carry = _mm512_cmplt_epu16_mask(middle, below);
        return _mm512_srl_epi16(_mm512_mask_sub_epi16(above, carry, above, _mm512_set1_epi16(-1)), m_shift);
    }

private:
    Vector m_high;
    Vector m_low;
    __m128i m_shift;
};

/// The sums of sixteen boxes, or sixteen pixels of rows, by channel.
struct Sums {
    Vector even;
    Vector odd;

    KX_AVX512 Sums()
        : even(_mm512_setzero_si512())
        , odd(_mm512_setzero_si512()) {}
    /// Each channel * weight >> 8: as the high byte of a word, times the weight, it is the high word.
    KX_AVX512 void add(Vector pixels, Vector weights) {
        even = _mm512_add_epi16(even, _mm512_mulhi_epu16(_mm512_slli_epi16(pixels, 8), weights));
        const Vector high = _mm512_and_si512(pixels, _mm512_set1_epi16(static_cast<short>(0xFF00)));
        odd = _mm512_add_epi16(odd, _mm512_mulhi_epu16(high, weights));
    }
    /// Times 255 >> 8 is one less, and 0 for 0.
    KX_AVX512 void addWhole(Vector pixels) {
        const Vector less = _mm512_subs_epu8(pixels, _mm512_set1_epi8(1));
        even = _mm512_add_epi16(even, evenWords(less));
        odd = _mm512_add_epi16(odd, oddWords(less));
    }
    KX_AVX512 Vector averaged(const Average& average) const { return fromWords(average(even), average(odd)); }
};

/// The parts of a pixel that boxes cover, of 0x10000, as weights for its channels; all of it counts as
/// 0xFFFF.
KX_AVX512 inline Vector weightWords(Vector covered) {
    const Vector secondByte = _mm512_broadcast_i32x4(_mm_set_epi64x(
        static_cast<std::int64_t>(0x800D800D80098009), static_cast<std::int64_t>(0x8005800580018001)));
    return _mm512_shuffle_epi8(_mm512_min_epu32(covered, _mm512_set1_epi32(0xFFFF)), secondByte);
}

/// Sixteen boxes at once, a pixel of each at a time.
KX_AVX512 inline Sums boxSums(const std::uint8_t* from, Vector positions, std::uint32_t step,
                              __mmask16 active) {
    const Vector whole = _mm512_set1_epi32(0x10000);
    const Vector zero = _mm512_setzero_si512();
    const Vector index = _mm512_srli_epi32(positions, 16);
    const Vector first = _mm512_sub_epi32(whole, _mm512_and_si512(positions, _mm512_set1_epi32(0xFFFF)));
    Sums sums;
    sums.add(_mm512_mask_i32gather_epi32(zero, active, index, from, 4), weightWords(first));
    // So many pixels lie within every box; after them come one or two that some boxes cover.
    const auto wholes = std::min<std::uint32_t>(step >> 16, BoxRun::maximum);
    std::uint32_t tap = 1;
    for (; tap < wholes; ++tap)
        sums.addWhole(_mm512_mask_i32gather_epi32(zero, active, index, from + std::size_t{tap} * 4, 4));
    Vector remaining =
        _mm512_sub_epi32(_mm512_set1_epi32(static_cast<int>(step - (tap - 1) * 0x10000)), first);
    for (; tap < BoxRun::maximum; ++tap) {
        active = _mm512_mask_test_epi32_mask(active, remaining, remaining);
        if (active == 0) break;
        sums.add(_mm512_mask_i32gather_epi32(zero, active, index, from + std::size_t{tap} * 4, 4),
                 weightWords(remaining));
        remaining = _mm512_sub_epi32(_mm512_max_epu32(remaining, whole), whole);
    }
    return sums;
}

KX_AVX512 void sampleBoxRow(std::uint8_t* to, const std::uint8_t* from, Sampling s, std::size_t count) {
    const std::int64_t room = (std::int64_t{s.sourceCount} << 16) - s.position;
    const std::int64_t within =
        s.position < 0 || room < 0 ? 0 : std::min(static_cast<std::int64_t>(count), room / s.step);
    const Average average(s.step);
    const Vector steps = ramp(s.step);
    for (std::int64_t left = within; left > 0;
         left -= lanes, to += vectorBytes, s.position += lanes * s.step) {
        const Vector at = _mm512_add_epi32(steps, _mm512_set1_epi32(static_cast<int>(s.position & 0xFFFF)));
        const Sums sums = boxSums(from + (s.position >> 16) * 4, at, s.step, firstLanes(left));
        storePixels(to, sums.averaged(average), left);
    }
    // The last vector may have gone beyond.
    const std::int64_t beyond = (within + lanes - 1) / lanes * lanes - within;
    s.position -= beyond * s.step;
    scalarRowOps.sampleBox({to - beyond * 4, 0}, {from, 0}, 1, s, count - static_cast<std::size_t>(within));
}

KX_AVX512 void sampleBox(RasterRows<std::uint8_t> to, RasterRows<const std::uint8_t> from, std::size_t rows,
                         Sampling s, std::size_t count) {
    // Two or four whole pixels need no gathering.
    if (s.step == 0x20000 || s.step == 0x40000) return avx2::rowOps.sampleBox(to, from, rows, s, count);
    for (; rows > 0; --rows, to.data += to.bytesPerRow, from.data += from.bytesPerRow)
        sampleBoxRow(to.data, from.data, s, count);
}

KX_AVX512 void averageRows(std::uint8_t* to, const std::uint8_t* const* rows, const BoxRun& run,
                           std::uint32_t step, std::size_t count) {
    const Average average(step);
    std::size_t at = 0;
    for (auto left = static_cast<std::int64_t>(count); left > 0; left -= lanes, at += vectorBytes) {
        Sums sums;
        for (int i = 0; i < run.count; ++i)
            sums.add(loadPixels(rows[i] + at, left), _mm512_set1_epi16(run.weights[i]));
        storePixels(to + at, sums.averaged(average), left);
    }
}

KX_AVX512 void unpremultiply(std::uint8_t* pixels, std::size_t count, int alphaByte) {
    avx2::rowOps.unpremultiply(pixels, count, alphaByte);
}

} // namespace

extern constexpr RowOps rowOps{"AVX-512",     permute, premultiply,  unpremultiply, multiply,   blend,
                               sampleNearest, nullptr, sampleLinear, sampleBox,     averageRows};

} // namespace raster::avx512
