#include "lib/raster/avx2.h"
#include "lib/raster/rasterops.h"
#include "lib/raster/rowops.h"

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>

namespace raster::avx2 {

namespace {

/// floor(sum * 65536 / step) of words below 2^13. The reciprocal has 32 bits and is too large by less than
/// one of them, 2^shift above the result, which is less than the distance from any quotient to the next whole
/// one.
class Average {
public:
    KX_AVX2 explicit Average(std::uint32_t step) {
        const auto shift = static_cast<int>(std::bit_width(step - 1)) - 14;
        const std::uint64_t reciprocal = ((1ULL << (45 + shift)) + step - 1) / step;
        m_high = _mm256_set1_epi16(static_cast<short>(reciprocal >> 16));
        m_low = _mm256_set1_epi16(static_cast<short>(reciprocal & 0xFFFF));
        m_shift = _mm_cvtsi32_si128(shift);
    }
    KX_AVX2_INLINE Vector operator()(Vector sums) const {
        const Vector value = _mm256_slli_epi16(sums, 3);
        // With its sign flipped, as the comparison takes it: an unsigned sum below what was added has
        // carried.
        const Vector below =
            _mm256_xor_si256(_mm256_mulhi_epu16(value, m_low), _mm256_set1_epi16(static_cast<short>(0x8000)));
        const Vector middle = _mm256_add_epi16(_mm256_mullo_epi16(value, m_high), below);
        const Vector above = _mm256_mulhi_epu16(value, m_high);
        return _mm256_srl_epi16(_mm256_sub_epi16(above, _mm256_cmpgt_epi16(below, middle)), m_shift);
    }

private:
    Vector m_high;
    Vector m_low;
    __m128i m_shift;
};

/// The same for a step of 2, 4, 8, 16 or 32 whole pixels.
class ShiftedAverage {
public:
    static bool isOf(std::uint32_t step) { return std::has_single_bit(step) && step <= 0x200000; }
    KX_AVX2 explicit ShiftedAverage(std::uint32_t step)
        : m_shift(_mm_cvtsi32_si128(std::countr_zero(step) - 16)) {}
    KX_AVX2_INLINE Vector operator()(Vector sums) const { return _mm256_srl_epi16(sums, m_shift); }

private:
    __m128i m_shift;
};

/// Sums of eight pixels by channel in words, at most 32 * 254.
struct Sums {
    Vector low;
    Vector high;

    /// For so many calls of addWhole.
    KX_AVX2_INLINE explicit Sums(std::int64_t pairs)
        : low(_mm256_set1_epi16(static_cast<short>(-2 * pairs)))
        , high(low) {}
    /// Each channel * weight >> 8: as the high byte of a word, times the weight, it is the high word.
    KX_AVX2_INLINE void add(Vector pixels, std::uint32_t weight) {
        const Vector zero = _mm256_setzero_si256();
        const Vector weights = _mm256_set1_epi16(static_cast<short>(weight));
        low = _mm256_add_epi16(low, _mm256_mulhi_epu16(_mm256_unpacklo_epi8(zero, pixels), weights));
        high = _mm256_add_epi16(high, _mm256_mulhi_epu16(_mm256_unpackhi_epi8(zero, pixels), weights));
    }
    /// Whole pixels weigh 255: times 255 >> 8 is one less, and 0 for 0. The one is taken off beforehand.
    KX_AVX2_INLINE void addWhole(Vector a, Vector b) {
        const Vector one = _mm256_set1_epi8(1);
        const Vector atLeastA = _mm256_max_epu8(a, one);
        const Vector atLeastB = _mm256_max_epu8(b, one);
        low = _mm256_add_epi16(low, _mm256_maddubs_epi16(_mm256_unpacklo_epi8(atLeastA, atLeastB), one));
        high = _mm256_add_epi16(high, _mm256_maddubs_epi16(_mm256_unpackhi_epi8(atLeastA, atLeastB), one));
    }
    template <typename Division>
    KX_AVX2_INLINE Vector averaged(const Division& average) const {
        return _mm256_packus_epi16(average(low), average(high));
    }
};

/// Rows of eight pixels become columns, and the other way round.
KX_AVX2_INLINE void transpose(Vector (&rows)[lanes]) {
    Vector pairs[lanes];
    Vector fours[lanes];
#pragma GCC unroll 4
    for (int i = 0; i < lanes; i += 2) {
        pairs[i] = _mm256_unpacklo_epi32(rows[i], rows[i + 1]);
        pairs[i + 1] = _mm256_unpackhi_epi32(rows[i], rows[i + 1]);
    }
#pragma GCC unroll 4
    for (int i = 0; i < lanes; i += 2) {
        const int pair = i / 4 * 4 + i / 2 % 2;
        fours[i] = _mm256_unpacklo_epi64(pairs[pair], pairs[pair + 2]);
        fours[i + 1] = _mm256_unpackhi_epi64(pairs[pair], pairs[pair + 2]);
    }
#pragma GCC unroll 4
    for (int i = 0; i < lanes / 2; ++i) {
        rows[i] = _mm256_permute2x128_si256(fours[i], fours[i + 4], 0x20);
        rows[i + 4] = _mm256_permute2x128_si256(fours[i], fours[i + 4], 0x31);
    }
}

/// The pixels of every box of a step: the first one, some that lie wholly within, and two more of which a box
/// covers as much as is left of its step.
struct BoxShape {
    std::uint32_t step;
    int whole;
    std::uint32_t mostAtEnd; ///< that may be covered of both together: no more than the maximum takes part

    explicit BoxShape(std::uint32_t boxStep)
        : step(boxStep) {
        const int pixels = std::min(static_cast<int>(step >> 16), BoxRun::maximum);
        whole = pixels - 1;
        mostAtEnd = static_cast<std::uint32_t>(std::min(2, BoxRun::maximum - pixels)) << 16;
    }
    int pixels() const { return 1 + whole + 2; }
};

/// Of the part of a pixel that is covered, of 0x10000.
std::uint32_t weightOf(std::uint32_t covered) {
    return std::min(covered, 0xFFFFU) >> 8;
}

/// A box of eight rows, from the column that it begins in. No branch depends on where in it.
KX_AVX2_INLINE Sums boxSums(const Vector* column, std::int64_t position, const BoxShape& shape) {
    const auto first = 0x10000 - static_cast<std::uint32_t>(position & 0xFFFF);
    const std::uint32_t rest = shape.step - first - (static_cast<std::uint32_t>(shape.whole) << 16);
    const std::uint32_t left = std::min(rest, shape.mostAtEnd);
    Sums sums((shape.whole + 1) / 2);
    sums.add(*column++, weightOf(first));
    int whole = shape.whole;
    for (; whole > 1; whole -= 2, column += 2)
        sums.addWhole(column[0], column[1]);
    if (whole > 0) sums.addWhole(*column++, _mm256_setzero_si256());
    sums.add(column[0], weightOf(left));
    sums.add(column[1], weightOf(left - std::min(left, 0x10000U)));
    return sums;
}

/// The weights of a box are the same for all rows: eight of them are summed at once, from vectors that hold
/// a column each.
class BoxSampler {
public:
    KX_AVX2 BoxSampler(RasterRows<const std::uint8_t> from, const Sampling& sampling)
        : m_from(from)
        , m_sampling(sampling)
        , m_shape(sampling.step)
        , m_average(sampling.step) {
        while (m_together > 1 &&
               (m_together * std::int64_t{sampling.step} >> 16) + m_shape.pixels() + lanes > most)
            m_together /= 2;
    }
    KX_AVX2 void sample(RasterRows<std::uint8_t> to, std::int64_t count) {
        Vector boxes[lanes] = {};
        for (std::int64_t x = 0; x < count; x += lanes) {
            const std::int64_t end = std::min(count - x, lanes);
            for (std::int64_t i = 0; i < end; i += m_together)
                averageBoxes(boxes + i, m_sampling.position + (x + i) * m_sampling.step,
                             std::min(end - i, m_together));
            transpose(boxes);
#pragma GCC unroll 8
            for (int i = 0; i < lanes; ++i)
                storePixels(to.data + i * to.bytesPerRow + x * 4, boxes[i], count - x);
        }
    }

private:
    KX_AVX2_INLINE void averageBoxes(Vector* boxes, std::int64_t position, std::int64_t count) {
        // Not the members, which the compiler would load anew for each box.
        const Average average = m_average;
        const BoxShape shape = m_shape;
        const std::int64_t first = position >> 16;
        const std::int64_t last = position + (count - 1) * shape.step;
        readColumns(first, (last >> 16) + shape.pixels());
        for (; position <= last; position += shape.step)
            *boxes++ = boxSums(m_columns + ((position >> 16) - first), position, shape).averaged(average);
    }
    /// Columns beyond the rows are clear.
    KX_AVX2_INLINE void readColumns(std::int64_t column, std::int64_t end) {
        const std::int64_t inEights = std::min(end, m_sampling.sourceCount - lanes + 1);
        Vector* columns = m_columns;
        for (; column < inEights; column += lanes, columns += lanes)
            readEight(columns, column, lanes);
        for (; column < end; column += lanes, columns += lanes)
            readEight(columns, column, m_sampling.sourceCount - column);
    }
    KX_AVX2_INLINE void readEight(Vector* columns, std::int64_t column, std::int64_t left) {
        const std::uint8_t* const from = m_from.data + column * 4;
        Vector block[lanes];
#pragma GCC unroll 8
        for (int i = 0; i < lanes; ++i)
            block[i] = loadPixels(from + i * m_from.bytesPerRow, left);
        transpose(block);
#pragma GCC unroll 8
        for (int i = 0; i < lanes; ++i)
            columns[i] = block[i];
    }

    static constexpr std::int64_t most = 128;
    Vector m_columns[most];
    RasterRows<const std::uint8_t> m_from;
    Sampling m_sampling;
    BoxShape m_shape;
    Average m_average;
    std::int64_t m_together = lanes; ///< boxes whose columns there is room for
};

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

/// How many boxes lie within the row.
std::int64_t boxesWithin(const Sampling& s, std::size_t count) {
    const std::int64_t room = (std::int64_t{s.sourceCount} << 16) - s.position;
    if (s.position < 0 || room < 0) return 0;
    return std::min(static_cast<std::int64_t>(count), room / s.step);
}

/// Rows to average; only the first and the last may count in part.
class RowGroup {
public:
    RowGroup(const std::uint8_t* const* rows, const BoxRun& run)
        : m_rows(rows)
        , m_run(run)
        , m_first(run.weights[0] == 255 ? 0 : 1)
        , m_end(std::max(m_first, run.weights[run.count - 1] == 255 ? run.count : run.count - 1)) {}
    template <typename Division>
    KX_AVX2_INLINE void average(std::uint8_t* to, std::int64_t count, const Division& division) const {
        std::int64_t x = 0;
        for (; x + lanes <= count; x += lanes)
            storePixels(to + x * 4, sumsAt(x * 4, lanes).averaged(division), lanes);
        if (x < count) storePixels(to + x * 4, sumsAt(x * 4, count - x).averaged(division), count - x);
    }

private:
    KX_AVX2_INLINE Vector pixels(std::int64_t row, std::int64_t at, std::int64_t left) const {
        return loadPixels(m_rows[row] + at, left);
    }
    KX_AVX2_INLINE Sums sumsAt(std::int64_t at, std::int64_t left) const {
        Sums sums((m_end - m_first + 1) / 2);
        if (m_first > 0) sums.add(pixels(0, at, left), m_run.weights[0]);
        std::int64_t row = m_first;
        for (; row + 1 < m_end; row += 2)
            sums.addWhole(pixels(row, at, left), pixels(row + 1, at, left));
        if (row < m_end) sums.addWhole(pixels(row, at, left), _mm256_setzero_si256());
        if (m_end < m_run.count) sums.add(pixels(m_end, at, left), m_run.weights[m_end]);
        return sums;
    }

    const std::uint8_t* const* m_rows;
    const BoxRun& m_run;
    int m_first;
    int m_end;
};

} // namespace

KX_AVX2 void sampleBox(RasterRows<std::uint8_t> to, RasterRows<const std::uint8_t> from, std::size_t rows,
                       Sampling s, std::size_t count) {
    const std::int64_t within = boxesWithin(s, count);
    std::int64_t done = 0;
    for (std::size_t y = 0; y < rows; ++y) {
        const auto row = static_cast<std::ptrdiff_t>(y);
        done = halveOrQuarter(to.data + row * to.bytesPerRow, from.data + row * from.bytesPerRow, s, within);
    }
    s.position += done * s.step;
    to.data += done * 4;
    if (rows == RowOps::mostBoxRows) {
        BoxSampler(from, s).sample(to, within - done);
    } else {
        // Fewer rows: each for all of them.
        for (std::size_t y = 0; y < rows; ++y) {
            const auto row = static_cast<std::ptrdiff_t>(y);
            BoxSampler({from.data + row * from.bytesPerRow, 0}, s)
                .sample({to.data + row * to.bytesPerRow, 0}, within - done);
        }
    }
    s.position += (within - done) * s.step;
    to.data += (within - done) * 4;
    scalarRowOps.sampleBox(to, from, rows, s, count - static_cast<std::size_t>(within));
}

KX_AVX2 void averageRows(std::uint8_t* to, const std::uint8_t* const* rows, const BoxRun& run,
                         std::uint32_t step, std::size_t count) {
    const RowGroup group(rows, run);
    if (ShiftedAverage::isOf(step))
        group.average(to, static_cast<std::int64_t>(count), ShiftedAverage(step));
    else
        group.average(to, static_cast<std::int64_t>(count), Average(step));
}

} // namespace raster::avx2
