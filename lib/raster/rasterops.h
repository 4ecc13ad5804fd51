#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

/// Whole-pixel rectangles and operations on blocks of pixels in memory. Rows may stand at any address and
/// distance.

/// Right and bottom are outside.
struct RasterRect {
    std::int64_t left = 0;
    std::int64_t top = 0;
    std::int64_t right = 0;
    std::int64_t bottom = 0;

    static RasterRect fromSize(std::int64_t x, std::int64_t y, std::int64_t width, std::int64_t height) {
        return {x, y, x + width, y + height};
    }
    std::int64_t width() const { return right - left; }
    std::int64_t height() const { return bottom - top; }
    bool isEmpty() const { return !(left < right && top < bottom); }
    friend bool operator==(const RasterRect&, const RasterRect&) = default;
};

RasterRect Raster_Intersection(const RasterRect& a, const RasterRect& b);

/// Rows of 32-bit pixels.
struct RasterBlock {
    std::uint8_t* data;
    std::ptrdiff_t bytesPerRow;
    std::size_t width;
    std::size_t height;
};

/// Where rows stand in memory.
template <typename Byte>
struct RasterRows {
    Byte* data;
    std::ptrdiff_t bytesPerRow;
};

/// Copies the pixels `from` of the source, of 1 to 4 bytes, as they are. Any other size is logged and false.
bool Raster_CopyBlock(RasterRows<std::uint8_t> destination, RasterRows<const std::uint8_t> source,
                      int bytesPerPixel, const RasterRect& from, std::int64_t toX, std::int64_t toY);

/// Byte i of a pixel takes its old byte map[i].
using RasterChannelMap = std::array<std::uint8_t, 4>;
constexpr RasterChannelMap rasterBGRAToARGB{3, 2, 1, 0};
constexpr RasterChannelMap rasterRGBAToARGB{3, 0, 1, 2};
constexpr RasterChannelMap rasterARGBToRGBA{1, 2, 3, 0};

void Raster_Permute(const RasterBlock& block, const RasterChannelMap& map);
/// Fills `block` from as many rows, read from the last one up; the two do not overlap.
void Raster_PermuteFlipped(const RasterBlock& block, const std::uint8_t* source,
                           std::ptrdiff_t sourceBytesPerRow, const RasterChannelMap& map);

/// (c * a + 127) / 255, and back min(255, (c * 255 + a / 2) / a), 0 for alpha 0; alpha is byte 0 or 3.
void Raster_Premultiply(const RasterBlock& block, int alphaByte);
void Raster_Unpremultiply(const RasterBlock& block, int alphaByte);

/// How a pixel's four bytes are meant.
struct RasterLayout {
    bool alphaFirst;
    bool premultiplied;
};

/// Darkens `block` with the colours of `source`, as far as those are opaque. Alpha stays.
void Raster_Multiply(const RasterBlock& block, RasterLayout layout, const std::uint8_t* source,
                     std::ptrdiff_t sourceBytesPerRow, RasterLayout sourceLayout);
