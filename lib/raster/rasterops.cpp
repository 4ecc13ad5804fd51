#include "lib/raster/rasterops.h"

#include "lib/base/Log.h"
#include "lib/raster/rowops.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>

using raster::rowOps;

RasterRect Raster_Intersection(const RasterRect& a, const RasterRect& b) {
    return {std::max(a.left, b.left), std::max(a.top, b.top), std::min(a.right, b.right),
            std::min(a.bottom, b.bottom)};
}

bool Raster_CopyBlock(RasterRows<std::uint8_t> destination, RasterRows<const std::uint8_t> source,
                      int bytesPerPixel, const RasterRect& from, std::int64_t toX, std::int64_t toY) {
    if (bytesPerPixel < 1 || bytesPerPixel > 4) {
        Warning("Raster: Unsupported frame buffer depth\n");
        return false;
    }
    if (from.isEmpty()) return true;
    std::uint8_t* to = destination.data + toY * destination.bytesPerRow + toX * bytesPerPixel;
    const std::uint8_t* row = source.data + from.top * source.bytesPerRow + from.left * bytesPerPixel;
    const auto length = static_cast<std::size_t>(from.width()) * static_cast<std::size_t>(bytesPerPixel);
    for (std::int64_t y = 0; y < from.height(); ++y)
        std::memmove(to + y * destination.bytesPerRow, row + y * source.bytesPerRow, length);
    return true;
}

namespace {

/// Rows that follow one another without a gap are one row.
RasterBlock joined(const RasterBlock& block) {
    const std::size_t pixels = block.width * block.height;
    const bool gapless = block.bytesPerRow == static_cast<std::ptrdiff_t>(block.width * 4);
    return gapless ? RasterBlock{block.data, block.bytesPerRow, pixels, 1} : block;
}

template <typename RowFunction>
void forEachRow(const RasterBlock& block, RowFunction&& function) {
    std::uint8_t* row = block.data;
    for (std::size_t y = 0; y < block.height; ++y, row += block.bytesPerRow)
        function(row, block.width);
}

} // namespace

void Raster_Permute(const RasterBlock& block, const RasterChannelMap& map) {
    const RasterBlock rows = joined(block);
    rowOps().permute(rows, rows.data, rows.bytesPerRow, map);
}

void Raster_PermuteFlipped(const RasterBlock& block, const std::uint8_t* source,
                           std::ptrdiff_t sourceBytesPerRow, const RasterChannelMap& map) {
    if (block.height == 0) return;
    const std::uint8_t* const last =
        source + (static_cast<std::ptrdiff_t>(block.height) - 1) * sourceBytesPerRow;
    rowOps().permute(block, last, -sourceBytesPerRow, map);
}

void Raster_Premultiply(const RasterBlock& block, int alphaByte) {
    forEachRow(joined(block),
               [&](std::uint8_t* row, std::size_t width) { rowOps().premultiply(row, width, alphaByte); });
}

void Raster_Unpremultiply(const RasterBlock& block, int alphaByte) {
    forEachRow(joined(block),
               [&](std::uint8_t* row, std::size_t width) { rowOps().unpremultiply(row, width, alphaByte); });
}

void Raster_Multiply(const RasterBlock& block, RasterLayout layout, const std::uint8_t* source,
                     std::ptrdiff_t sourceBytesPerRow, RasterLayout sourceLayout) {
    forEachRow(block, [&](std::uint8_t* row, std::size_t width) {
        rowOps().multiply(row, layout, source, sourceLayout, width);
        source += sourceBytesPerRow;
    });
}
