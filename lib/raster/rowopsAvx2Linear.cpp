#include "lib/raster/avx2.h"
#include "lib/raster/pixel.h"
#include "lib/raster/rasterops.h"
#include "lib/raster/rowops.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <span>

namespace raster::avx2 {

namespace {

/// From sums of pixels with flipped sign, weighted with 255 in all, to pixels: such a sum stays within a
/// signed word, and its rounded high byte is the result less 127.
KX_AVX2_INLINE Vector blended(Vector low, Vector high) {
    const Vector highByte = _mm256_set1_epi16(128);
    const Vector bytes =
        _mm256_packs_epi16(_mm256_mulhrs_epi16(low, highByte), _mm256_mulhrs_epi16(high, highByte));
    return _mm256_add_epi8(bytes, _mm256_set1_epi8(127));
}

KX_AVX2_INLINE Vector flipped(Vector pixels) {
    return _mm256_xor_si256(pixels, _mm256_set1_epi8(-128));
}

/// Eight pixels, or the first `left`, of each of `Rows` rows: what they have in common is done once.
template <int Rows>
KX_AVX2_INLINE void blendPixels(RasterRows<std::uint8_t> to, Vector a, Vector b, const Vector* weights,
                                std::int64_t left) {
    const Vector low = _mm256_unpacklo_epi8(flipped(a), flipped(b));
    const Vector high = _mm256_unpackhi_epi8(flipped(a), flipped(b));
#pragma GCC unroll 4
    for (int row = 0; row < Rows; ++row)
        storePixels(
            to.data + row * to.bytesPerRow,
            blended(_mm256_maddubs_epi16(weights[row], low), _mm256_maddubs_epi16(weights[row], high)), left);
}

template <int Rows>
KX_AVX2 void blendRows(RasterRows<std::uint8_t> to, const std::uint8_t* a, const std::uint8_t* b,
                       const std::uint8_t* weights, std::int64_t count) {
    // 255 - w in the low byte and w above it.
    Vector pairs[Rows];
    for (int row = 0; row < Rows; ++row)
        pairs[row] = _mm256_set1_epi16(static_cast<short>(weights[row] * 255 + 255));
    std::int64_t at = 0;
    for (; at + lanes <= count; at += lanes)
        blendPixels<Rows>({to.data + at * 4, to.bytesPerRow}, loadPixels(a + at * 4, lanes),
                          loadPixels(b + at * 4, lanes), pairs, lanes);
    if (at == count) return;
    // The last eight once more, with those that are left, take less time than to write a part of a vector.
    const std::int64_t rest = std::min(count, lanes);
    at = count - rest;
    blendPixels<Rows>({to.data + at * 4, to.bytesPerRow}, loadPixels(a + at * 4, rest),
                      loadPixels(b + at * 4, rest), pairs, rest);
}

/// Of any enlargement: which two neighbours make each of eight pixels, and with which weights; both depend on
/// the fraction of the first position only.
struct Taps {
    std::int64_t fraction = -1;
    Vector indices;
    Vector lowWeights;
    Vector highWeights;

    KX_AVX2 Taps()
        : indices(_mm256_setzero_si256())
        , lowWeights(indices)
        , highWeights(indices) {}
    KX_AVX2 void moveTo(std::int64_t position, const Ramp& ramp) {
        if ((position & 0xFFFF) == fraction) return;
        fraction = position & 0xFFFF;
        const Vector positions = ramp.at(position);
        indices = _mm256_srli_epi32(positions, 16);
        const Vector byte = _mm256_set1_epi32(0xFF);
        const Vector weight = _mm256_and_si256(_mm256_srli_epi32(positions, 8), byte);
        // 255 - w in the low byte and w above it, twice.
        const Vector pair = _mm256_add_epi32(byte, _mm256_sub_epi32(_mm256_slli_epi32(weight, 8), weight));
        const Vector pairs = _mm256_or_si256(pair, _mm256_slli_epi32(pair, 16));
        lowWeights = _mm256_unpacklo_epi32(pairs, pairs);
        highWeights = _mm256_unpackhi_epi32(pairs, pairs);
    }
    KX_AVX2_INLINE Vector apply(Vector pixels, Vector next) const {
        const Vector a = _mm256_permutevar8x32_epi32(flipped(pixels), indices);
        const Vector b = _mm256_permutevar8x32_epi32(flipped(next), indices);
        return blended(_mm256_maddubs_epi16(lowWeights, _mm256_unpacklo_epi8(a, b)),
                       _mm256_maddubs_epi16(highWeights, _mm256_unpackhi_epi8(a, b)));
    }
};

/// Of enlargements to the double and more: the four pixels of a half come from four neighbours, and one
/// shuffle of bytes finds and pairs them.
struct NearTaps {
    Vector lowBytes;
    Vector highBytes;
    Vector lowWeights;
    Vector highWeights;

    NearTaps() = default;
    /// The halves' neighbours begin at two pixels of the row.
    KX_AVX2 NearTaps(std::int64_t position, std::int64_t step, std::int64_t lowFirst,
                     std::int64_t highFirst) {
        const std::int64_t atLow = position - (lowFirst << 16);
        const std::int64_t atHigh = position + 4 * step - (highFirst << 16);
        const Vector low = _mm256_setr_epi64x(atLow, atLow + step, atHigh, atHigh + step);
        const Vector high = _mm256_add_epi64(low, _mm256_set1_epi64x(2 * step));
        lowBytes = bytesAt(low);
        highBytes = bytesAt(high);
        lowWeights = weightsAt(low);
        highWeights = weightsAt(high);
    }
    KX_AVX2_INLINE Vector apply(const std::uint8_t* lowFirst, const std::uint8_t* highFirst) const {
        const Vector pixels = flipped(_mm256_loadu2_m128i(reinterpret_cast<const __m128i*>(highFirst),
                                                          reinterpret_cast<const __m128i*>(lowFirst)));
        return blended(_mm256_maddubs_epi16(lowWeights, _mm256_shuffle_epi8(pixels, lowBytes)),
                       _mm256_maddubs_epi16(highWeights, _mm256_shuffle_epi8(pixels, highBytes)));
    }

private:
    /// A position's byte in all of its qword.
    KX_AVX2 static Vector byteOf(Vector positions, int byte) {
        const Vector firsts = _mm256_setr_epi64x(0, 0x0808080808080808, 0, 0x0808080808080808);
        return _mm256_shuffle_epi8(positions,
                                   _mm256_add_epi8(firsts, _mm256_set1_epi8(static_cast<char>(byte))));
    }
    /// The bytes of a pixel and the next one in pairs.
    KX_AVX2 static Vector bytesAt(Vector positions) {
        return _mm256_add_epi8(_mm256_slli_epi16(byteOf(positions, 2), 2),
                               _mm256_set1_epi64x(0x0703060205010400));
    }
    /// 255 - w and w in pairs.
    KX_AVX2 static Vector weightsAt(Vector positions) {
        return _mm256_xor_si256(byteOf(positions, 1), _mm256_set1_epi16(0xFF));
    }
};

/// The pixels between the edges in groups of eight. The last group ends at the edge, over pixels that are
/// done.
class NearPlan {
public:
    KX_AVX2 explicit NearPlan(const LinearPlan& plan)
        : m_step(plan.sampling.step)
        , m_start(plan.sampling.position + plan.parts.before * m_step)
        , m_pixels(plan.parts.between)
        , m_lastFirst(std::int64_t{plan.sampling.sourceCount} - 4) {
        if (!isUsable()) return;
        // Steps of a power of two come back to the same fraction, until the row's end moves the neighbours.
        const bool repeats = (lanes * m_step & 0xFFFF) == 0;
        while (repeats && m_alike < m_pixels / lanes && groupAt(m_alike * lanes).highFirst < m_lastFirst)
            ++m_alike;
        m_taps[0] = tapsOf(groupAt(0));
        for (std::int64_t i = m_alike; i * lanes < m_pixels && tapsIndex(i) < most; ++i)
            m_taps[tapsIndex(i)] = tapsOf(groupAt(i * lanes));
    }
    /// Enlargements to the double and more, of rows that are long enough.
    bool isUsable() const { return m_step <= 0x8000 && m_pixels >= lanes && m_lastFirst >= 0; }

    KX_AVX2 void sample(std::uint8_t* to, const std::uint8_t* from) const {
        sampleAlike(to, from);
        const NearTaps* taps = m_taps + tapsIndex(m_alike);
        std::int64_t x = m_alike * lanes;
        for (; x < m_pixels && taps < m_taps + most; x += lanes, ++taps)
            sampleGroup(to, from, groupAt(x), *taps);
        for (; x < m_pixels; x += lanes)
            sampleGroup(to, from, groupAt(x), tapsOf(groupAt(x)));
    }

private:
    struct Group {
        std::int64_t pixel;
        std::int64_t position;
        std::int64_t lowFirst;
        std::int64_t highFirst;
    };
    KX_AVX2_INLINE static void sampleGroup(std::uint8_t* to, const std::uint8_t* from, const Group& group,
                                           const NearTaps& taps) {
        storePixels(to + group.pixel * 4, taps.apply(from + group.lowFirst * 4, from + group.highFirst * 4),
                    lanes);
    }
    Group groupAt(std::int64_t x) const {
        const std::int64_t pixel = std::min(x, m_pixels - lanes);
        const std::int64_t position = m_start + pixel * m_step;
        return {pixel, position, std::min(position >> 16, m_lastFirst),
                std::min((position + 4 * m_step) >> 16, m_lastFirst)};
    }
    std::int64_t tapsIndex(std::int64_t group) const { return m_alike == 0 ? group : group - m_alike + 1; }
    KX_AVX2 NearTaps tapsOf(const Group& group) const {
        return {group.position, m_step, group.lowFirst, group.highFirst};
    }
    KX_AVX2_INLINE void sampleAlike(std::uint8_t* to, const std::uint8_t* from) const {
        const NearTaps taps = m_taps[0];
        const Group first = groupAt(0);
        const std::int64_t advance = (lanes * m_step >> 16) * 4;
        const std::uint8_t* low = from + first.lowFirst * 4;
        const std::uint8_t* high = from + first.highFirst * 4;
#pragma GCC unroll 2
        for (std::int64_t i = m_alike; i > 0; --i, to += vectorBytes, low += advance, high += advance)
            storePixels(to, taps.apply(low, high), lanes);
    }

    static constexpr std::int64_t most = 63;
    NearTaps m_taps[most]; ///< the first groups' own, of those that are alike only one
    std::int64_t m_step;
    std::int64_t m_start;
    std::int64_t m_pixels;
    std::int64_t m_lastFirst;
    std::int64_t m_alike = 0; ///< groups at the beginning that have the same taps
};
static_assert(sizeof(NearPlan) <= LinearPlan::kernelBytes);

KX_AVX2 void enlarge(std::uint8_t* to, const std::uint8_t* from, const LinearPlan& plan) {
    const std::int64_t step = plan.sampling.step;
    const std::int64_t last = plan.sampling.sourceCount - 1;
    const std::int64_t between = plan.parts.between;
    std::int64_t position = plan.sampling.position + plan.parts.before * step;
    const Ramp ramp(plan.sampling.step);
    Taps taps;
    std::int64_t x = 0;
    // All but the last groups have eight pixels and a next one to read.
    for (; x + lanes <= between && (position >> 16) + lanes <= last; x += lanes, position += lanes * step) {
        const std::uint8_t* const pixel = from + (position >> 16) * 4;
        taps.moveTo(position, ramp);
        storePixels(to + x * 4, taps.apply(loadPixels(pixel, lanes), loadPixels(pixel + 4, lanes)), lanes);
    }
    for (; x < between; x += lanes, position += lanes * step) {
        const std::int64_t left = last - (position >> 16);
        const std::uint8_t* const pixel = from + (position >> 16) * 4;
        taps.moveTo(position, ramp);
        storePixels(to + x * 4, taps.apply(loadPixels(pixel, left + 1), loadPixels(pixel + 4, left)),
                    between - x);
    }
}

} // namespace

KX_AVX2 void blend(RasterRows<std::uint8_t> to, const std::uint8_t* a, const std::uint8_t* b,
                   std::span<const std::uint8_t> weights, std::size_t count) {
    static constexpr decltype(&blendRows<1>) byNumber[] = {blendRows<1>, blendRows<2>, blendRows<3>,
                                                           blendRows<4>};
    byNumber[weights.size() - 1](to, a, b, weights.data(), static_cast<std::int64_t>(count));
}

KX_AVX2 void planLinear(LinearPlan& plan) {
    new (plan.kernel) NearPlan(plan);
}

KX_AVX2 void sampleLinear(std::uint8_t* to, const std::uint8_t* from, const LinearPlan& plan) {
    const auto& near = *reinterpret_cast<const NearPlan*>(plan.kernel);
    const std::uint32_t first = load(from);
    const std::uint32_t last = load(from + std::ptrdiff_t{plan.sampling.sourceCount - 1} * 4);
    fill(to, blendWords(first, first, 0), plan.parts.before);
    to += plan.parts.before * 4;
    if (near.isUsable())
        near.sample(to, from);
    else
        enlarge(to, from, plan);
    fill(to + plan.parts.between * 4, blendWords(last, last, 0), plan.parts.after);
}

} // namespace raster::avx2
