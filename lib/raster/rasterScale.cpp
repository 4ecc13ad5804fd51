#include "lib/raster/rasterScale.h"

#include "lib/base/CheckedMalloc.h"
#include "lib/base/Log.h"
#include "lib/raster/pixel.h"
#include "lib/raster/rasterops.h"
#include "lib/raster/rowops.h"

#include <algorithm>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>

using raster::blendWords;
using raster::BoxRun;
using raster::boxRun;
using raster::BoxSum;
using raster::indexAt;
using raster::LinearPlan;
using raster::load;
using raster::rowOps;
using raster::Sampling;
using raster::store;
using raster::weightAt;

namespace {

struct Format {
    int bitsPerPixel;
    int depth;
    std::ptrdiff_t bytes() const { return bitsPerPixel / 8; }
    friend bool operator==(const Format&, const Format&) = default;
};

template <typename Byte>
struct FrameBuffer {
    Byte* memory;
    std::ptrdiff_t bytesPerRow;
    Format format;
    int width;
    int height;

    Byte* row(std::int64_t y) const { return memory + y * bytesPerRow; }
    bool isSane() const {
        constexpr int sizeLimit = 32768;
        return width < sizeLimit && height < sizeLimit && format.depth % 8 == 0 &&
               format.bitsPerPixel % 8 == 0;
    }
    /// What nothing may be read from or written to.
    bool isUnusable() const {
        return !memory || format.bitsPerPixel < 8 || format.bitsPerPixel > 32 ||
               bytesPerRow < width * format.bytes();
    }
};
using Source = FrameBuffer<const std::uint8_t>;
using Destination = FrameBuffer<std::uint8_t>;

constexpr Format packable{32, 24};

bool formatsAreSupported(const Format& from, const Format& to) {
    static std::atomic_flag destinationReported;
    static std::atomic_flag conversionReported;
    if (to.bitsPerPixel < to.depth) {
        if (!destinationReported.test_and_set())
            Warning("Raster_Scale: Dest color format (depth %d, BPP %d) is not supported.\n", to.depth,
                    to.bitsPerPixel);
        return false;
    }
    if (from == packable ? to.depth == 16 || to.depth == 24 : from == to) return true;
    if (!conversionReported.test_and_set())
        Warning("Raster_Scale: Color depth conversion from D%dB%d to D%dB%d is not supported.\n", from.depth,
                from.bitsPerPixel, to.depth, to.bitsPerPixel);
    return false;
}

/// How one axis is walked. Both axes begin half a source pixel early when they grow.
struct Axis {
    enum class Way { nearest, linear, box };
    std::uint32_t step;
    Way way;
    std::int64_t start;

    Axis(double scale, bool filtering, std::int64_t first) {
        constexpr double largest = 4294967295.0;
        // Cut off, not rounded.
        step = static_cast<std::uint32_t>(std::clamp(65536 / scale, 0.0, largest));
        way = !filtering || step == 0x10000 ? Way::nearest : step < 0x10000 ? Way::linear : Way::box;
        start = first * static_cast<std::int64_t>(step) - (way == Way::linear ? 0x8000 : 0);
    }
};

/// A pixel of 1 to 4 bytes as a word.
std::uint32_t loadNarrow(const std::uint8_t* from, std::ptrdiff_t bytes) {
    std::uint32_t word = 0;
    std::memcpy(&word, from, static_cast<std::size_t>(bytes));
    return word;
}

void packPixel(std::uint8_t* to, std::uint32_t word, const Format& from, const Format& format) {
    if (format == from) {
        std::memcpy(to, &word, static_cast<std::size_t>(format.bytes()));
    } else if (format.depth == 24) {
        std::memcpy(to, &word, 3);
    } else {
        const auto packed =
            static_cast<std::uint16_t>((word >> 3 & 0x1F) | (word >> 5 & 0x7E0) | (word >> 8 & 0xF800));
        std::memcpy(to, &packed, sizeof packed);
    }
}

/// Rows of narrower pixels are rare: one pixel's neighbours are widened at a time.
void scaleNarrowRow(std::uint8_t* to, const std::uint8_t* from, std::ptrdiff_t bytes, Axis::Way way,
                    Sampling s, std::size_t width) {
    const auto pixel = [&](std::int64_t index) {
        return loadNarrow(from + std::clamp<std::int64_t>(index, 0, s.sourceCount - 1) * bytes, bytes);
    };
    const std::uint64_t reciprocal = way == Axis::Way::box ? BoxSum::reciprocalOf(s.step) : 0;
    for (; width > 0; --width, to += 4, s.position += s.step) {
        const std::int64_t index = s.position >> 16;
        if (way == Axis::Way::nearest) {
            store(to, pixel(index));
        } else if (way == Axis::Way::linear) {
            store(to, blendWords(pixel(index), pixel(index + 1), weightAt(s.position)));
        } else {
            const BoxRun run = boxRun(s.position, s.step);
            BoxSum sum;
            for (int i = 0; i < run.count; ++i)
                sum.add(pixel(run.first + i), run.weights[i]);
            store(to, sum.average(reciprocal));
        }
    }
}

/// Scales source rows to the destination's width, as words.
class RowScaler {
public:
    RowScaler(const Source& source, const Axis& axis, std::int64_t width)
        : m_source(source)
        , m_way(axis.way)
        , m_plan({axis.start, axis.step, source.width}, width) {
        if (m_way == Axis::Way::linear && rowOps().planLinear) rowOps().planLinear(m_plan);
    }
    std::size_t width() const { return static_cast<std::size_t>(m_plan.count); }
    /// How many neighbours are made together.
    std::size_t bandRows() const { return m_way == Axis::Way::box ? raster::RowOps::mostBoxRows : 1; }
    /// Rows y ... y + count - 1, at most a band.
    void scaleRows(RasterRows<std::uint8_t> to, std::int64_t y, std::size_t count) const {
        if (m_way == Axis::Way::box && m_source.format.bytes() == 4)
            return rowOps().sampleBox(to, {m_source.row(y), m_source.bytesPerRow}, count, m_plan.sampling,
                                      width());
        for (; count > 0; --count, ++y, to.data += to.bytesPerRow)
            scaleRow(to.data, y);
    }
    void scaleRow(std::uint8_t* to, std::int64_t y) const {
        const std::uint8_t* const from = m_source.row(y);
        if (m_source.format.bytes() != 4)
            return scaleNarrowRow(to, from, m_source.format.bytes(), m_way, m_plan.sampling, width());
        switch (m_way) {
        case Axis::Way::nearest:
            return rowOps().sampleNearest(to, from, m_plan.sampling, width());
        case Axis::Way::linear:
            return rowOps().sampleLinear(to, from, m_plan);
        case Axis::Way::box:
            return rowOps().sampleBox({to, 0}, {from, 0}, 1, m_plan.sampling, width());
        }
    }

private:
    Source m_source;
    Axis::Way m_way;
    LinearPlan m_plan;
};

/// Scaled source rows, made in bands; band b stands in slot b modulo the number of slots. No vector of a row
/// crosses two cache lines.
class RowCache {
    static constexpr std::size_t lineBytes = 64;

public:
    /// Holds any `rows` neighbours at once; `spareRows` rows more stand behind them.
    RowCache(const RowScaler& scaler, int sourceHeight, std::size_t rows, std::size_t spareRows)
        : m_scaler(scaler)
        , m_height(sourceHeight)
        , m_bandRows(scaler.bandRows())
        , m_rowBytes((scaler.width() * 4 + 4 + lineBytes - 1) / lineBytes * lineBytes)
        , m_slots((rows + m_bandRows - 2) / m_bandRows + 1)
        , m_memory(static_cast<std::uint8_t*>(CheckedMalloc(
              -1,
              m_slots * sizeof(std::int64_t) + lineBytes + (m_slots * m_bandRows + spareRows) * m_rowBytes,
              "lib/raster/rasterScale", 188))) {
        const std::int64_t none = -1;
        for (std::size_t i = 0; i < m_slots; ++i)
            std::memcpy(held(i), &none, sizeof none);
    }

    std::uint8_t* spareRow() { return rowAt(m_slots * m_bandRows); }

    const std::uint8_t* row(std::int64_t y) {
        const std::int64_t band = static_cast<std::uint32_t>(y) / static_cast<std::uint32_t>(m_bandRows);
        const std::size_t slot = static_cast<std::uint32_t>(band) % static_cast<std::uint32_t>(m_slots);
        const auto first = band * static_cast<std::int64_t>(m_bandRows);
        std::uint8_t* const pixels = rowAt(slot * m_bandRows);
        if (std::memcmp(held(slot), &band, sizeof band) != 0) {
            std::memcpy(held(slot), &band, sizeof band);
            m_scaler.scaleRows({pixels, static_cast<std::ptrdiff_t>(m_rowBytes)}, first,
                               std::min(m_bandRows, static_cast<std::size_t>(m_height - first)));
        }
        return pixels + static_cast<std::size_t>(y - first) * m_rowBytes;
    }

private:
    struct Freed {
        void operator()(std::uint8_t* memory) const {
            // NOLINTNEXTLINE(cppcoreguidelines-no-malloc): the counterpart of CheckedMalloc
            std::free(memory);
        }
    };

    std::uint8_t* held(std::size_t slot) { return m_memory.get() + slot * sizeof(std::int64_t); }
    std::uint8_t* rowAt(std::size_t index) {
        std::uint8_t* const rows = m_memory.get() + m_slots * sizeof(std::int64_t);
        return rows + -reinterpret_cast<std::uintptr_t>(rows) % lineBytes + index * m_rowBytes;
    }

    const RowScaler& m_scaler;
    std::int64_t m_height;
    std::size_t m_bandRows;
    std::size_t m_rowBytes;
    std::size_t m_slots;
    std::unique_ptr<std::uint8_t, Freed> m_memory;
};

/// The next rows of the destination, as words.
struct Rows {
    RasterRows<std::uint8_t> to;
    std::int64_t position;
    std::int64_t count;
    std::size_t width;
};

/// Combines cached rows at a position to as many rows as come from the same ones, up to `rows.count`; how
/// many.
std::int64_t scaleColumns(const Rows& rows, RowCache& cache, const Axis& axis, int sourceHeight) {
    constexpr std::int64_t most = raster::RowOps::mostBlends;
    const auto rowAt = [&](std::int64_t index) {
        return cache.row(std::clamp<std::int64_t>(index, 0, sourceHeight - 1));
    };
    const std::int64_t index = rows.position >> 16;
    if (axis.way == Axis::Way::nearest) {
        std::memcpy(rows.to.data, rowAt(index), rows.width * 4);
    } else if (axis.way == Axis::Way::linear) {
        std::uint8_t weights[most];
        std::int64_t made = 0;
        for (std::int64_t at = rows.position; made < std::min(rows.count, most) && at >> 16 == index;
             at += axis.step)
            weights[made++] = weightAt(at);
        const std::uint8_t* const upper = rowAt(index);
        rowOps().blend(rows.to, upper, rowAt(index + 1), {weights, static_cast<std::size_t>(made)},
                       rows.width);
        return made;
    } else {
        const BoxRun run = boxRun(rows.position, axis.step);
        const std::uint8_t* boxRows[BoxRun::maximum];
        for (int i = 0; i < run.count; ++i)
            boxRows[i] = rowAt(run.first + i);
        rowOps().averageRows(rows.to.data, boxRows, run, axis.step, rows.width);
    }
    return 1;
}

std::size_t cachedRows(const Axis& vertical, bool filtering) {
    if (!filtering) return 1;
    const std::uint64_t rows = ((static_cast<std::uint64_t>(vertical.step) + 0xFFFF) >> 16) + 1;
    // Not 1, which a step of 0 would give: two neighbours are blended even then.
    return std::clamp<std::uint64_t>(rows, 2, BoxRun::maximum);
}

/// Without vertical filtering the destination is its own cache: a row that comes again is copied.
void scaleRowsInto(const Destination& to, const RasterRect& rect, const RowScaler& scaler,
                   const Axis& vertical, int sourceHeight) {
    const std::uint8_t* before = nullptr;
    std::int64_t heldRow = -1;
    std::int64_t position = vertical.start;
    for (std::int64_t y = rect.top; y < rect.bottom; ++y, position += vertical.step) {
        std::uint8_t* const row = to.row(y) + rect.left * 4;
        const std::int64_t sourceRow = indexAt(position, sourceHeight);
        if (sourceRow == heldRow)
            std::memcpy(row, before, scaler.width() * 4);
        else
            scaler.scaleRow(row, sourceRow);
        heldRow = sourceRow;
        before = row;
    }
}

void scaleInto(const Destination& to, const RasterRect& rect, const Source& from, const Axis& horizontal,
               const Axis& vertical, bool filtering) {
    const auto width = static_cast<std::size_t>(rect.width());
    const std::ptrdiff_t pixelBytes = to.format.bytes();
    const bool direct = to.format == from.format && pixelBytes == 4;
    const RowScaler scaler(from, horizontal, rect.width());
    if (direct && vertical.way == Axis::Way::nearest)
        return scaleRowsInto(to, rect, scaler, vertical, from.height);
    RowCache cache(scaler, from.height, cachedRows(vertical, filtering), direct ? 0 : 1);
    for (std::int64_t y = rect.top; y < rect.bottom;) {
        std::uint8_t* row = to.row(y) + rect.left * pixelBytes;
        std::uint8_t* words = direct ? row : cache.spareRow();
        const std::int64_t position = vertical.start + (y - rect.top) * std::int64_t{vertical.step};
        y += scaleColumns({{words, to.bytesPerRow}, position, direct ? rect.bottom - y : 1, width}, cache,
                          vertical, from.height);
        if (direct) continue;
        for (std::size_t x = 0; x < width; ++x, row += pixelBytes, words += 4)
            packPixel(row, load(words), from.format, to.format);
    }
}

} // namespace

// NOLINTNEXTLINE(readability-function-size): the given list
int Raster_Scale(void* destination, int destinationBytesPerRow, int destinationBitsPerPixel,
                 int destinationDepth, int destinationWidth, int destinationHeight, int /*reservedOne*/,
                 const RasterRect& rect, const void* source, int sourceBytesPerRow, int sourceBitsPerPixel,
                 int sourceDepth, int /*reservedZero*/, int sourceWidth, int sourceHeight,
                 int /*reservedAlsoOne*/, double horizontalScale, double verticalScale, int filter) {
    constexpr double smallestScale = 3.051850947599719e-05;
    const Destination to{static_cast<std::uint8_t*>(destination),
                         destinationBytesPerRow,
                         {destinationBitsPerPixel, destinationDepth},
                         destinationWidth,
                         destinationHeight};
    const Source from{static_cast<const std::uint8_t*>(source),
                      sourceBytesPerRow,
                      {sourceBitsPerPixel, sourceDepth},
                      sourceWidth,
                      sourceHeight};
    if (rect.left < 0 || rect.top < 0 || rect.right > to.width || rect.bottom > to.height) return 0;
    if (!formatsAreSupported(from.format, to.format) || !to.isSane() || !from.isSane()) return 0;
    // Not "scale <= smallest": NaN fails too.
    if (!(horizontalScale > smallestScale) || !(verticalScale > smallestScale)) return 0;
    // Only here: nothing to do with a bad size or scale is a failure, too.
    if (rect.isEmpty() || to.width == 0 || to.height == 0 || from.width == 0 || from.height == 0) return 1;
    if (to.isUnusable() || from.isUnusable() || from.width < 0 || from.height < 0) return 0;
    const bool filtering = to.format.depth >= 24 && filter != 0;
    scaleInto(to, rect, from, {horizontalScale, filtering, rect.left}, {verticalScale, filtering, rect.top},
              filtering);
    return 1;
}
