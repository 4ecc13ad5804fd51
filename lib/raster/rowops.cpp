#include "lib/raster/rowops.h"

#include "lib/raster/pixel.h"
#include "lib/raster/rasterops.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <span>

namespace raster {

namespace {

constexpr std::size_t pixelBytes = 4;

void permute(const RasterBlock& block, const std::uint8_t* from, std::ptrdiff_t fromBytesPerRow,
             const RasterChannelMap& map) {
    std::uint8_t* to = block.data;
    for (std::size_t y = 0; y < block.height; ++y, to += block.bytesPerRow, from += fromBytesPerRow)
        for (std::size_t i = 0; i < block.width * pixelBytes; i += pixelBytes) {
            const std::uint8_t pixel[] = {from[i + map[0]], from[i + map[1]], from[i + map[2]],
                                          from[i + map[3]]};
            std::memcpy(to + i, pixel, sizeof pixel);
        }
}

std::uint8_t scaled(unsigned value, unsigned factor) {
    return static_cast<std::uint8_t>((value * factor + 127) / 255);
}

void premultiply(std::uint8_t* pixels, std::size_t count, int alphaByte) {
    const int colour = alphaByte == 0 ? 1 : 0;
    for (std::uint8_t* p = pixels; p != pixels + count * pixelBytes; p += pixelBytes)
        for (int c = colour; c < colour + 3; ++c)
            p[c] = scaled(p[c], p[alphaByte]);
}

void unpremultiply(std::uint8_t* pixels, std::size_t count, int alphaByte) {
    const int colour = alphaByte == 0 ? 1 : 0;
    for (std::uint8_t* p = pixels; p != pixels + count * pixelBytes; p += pixelBytes) {
        const unsigned alpha = p[alphaByte];
        for (int c = colour; c < colour + 3; ++c)
            p[c] =
                alpha == 0 ? 0 : static_cast<std::uint8_t>(std::min(255U, (p[c] * 255U + alpha / 2) / alpha));
    }
}

// A pixel of alpha 0 needs no test: the formula leaves the target as it is.
void multiply(std::uint8_t* to, RasterLayout toLayout, const std::uint8_t* from, RasterLayout fromLayout,
              std::size_t count) {
    const std::uint8_t* alpha = from + (fromLayout.alphaFirst ? 0 : 3);
    const std::uint8_t* colour = from + (fromLayout.alphaFirst ? 1 : 0);
    std::uint8_t* target = to + (toLayout.alphaFirst ? 1 : 0);
    for (std::size_t i = 0; i < count * pixelBytes; i += pixelBytes) {
        const unsigned a = alpha[i];
        for (std::size_t c = i; c < i + 3; ++c) {
            const unsigned m =
                fromLayout.premultiplied ? std::min<unsigned>(a, colour[c]) : scaled(colour[c], a);
            target[c] = static_cast<std::uint8_t>(target[c] - scaled(target[c], a - m));
        }
    }
}

void blend(RasterRows<std::uint8_t> to, const std::uint8_t* a, const std::uint8_t* b,
           std::span<const std::uint8_t> weights, std::size_t count) {
    for (const std::uint8_t weight : weights) {
        for (std::size_t i = 0; i < count * pixelBytes; i += pixelBytes)
            store(to.data + i, blendWords(load(a + i), load(b + i), weight));
        to.data += to.bytesPerRow;
    }
}

void sampleNearest(std::uint8_t* to, const std::uint8_t* from, Sampling s, std::size_t count) {
    for (; count > 0; --count, to += pixelBytes, s.position += s.step)
        std::memcpy(to, from + indexAt(s.position, s.sourceCount) * 4, pixelBytes);
}

void sampleLinear(std::uint8_t* to, const std::uint8_t* from, const LinearPlan& plan) {
    Sampling s = plan.sampling;
    for (std::int64_t count = plan.count; count > 0; --count, to += pixelBytes, s.position += s.step) {
        const std::uint32_t left = load(from + indexAt(s.position, s.sourceCount) * 4);
        const std::uint32_t right = load(from + indexAt(s.position + 0x10000, s.sourceCount) * 4);
        store(to, blendWords(left, right, weightAt(s.position)));
    }
}

void sampleBoxRow(std::uint8_t* to, const std::uint8_t* from, Sampling s, std::size_t count) {
    const std::uint64_t reciprocal = BoxSum::reciprocalOf(s.step);
    for (; count > 0; --count, to += pixelBytes, s.position += s.step) {
        const BoxRun run = boxRun(s.position, s.step);
        BoxSum sum;
        for (int i = 0; i < run.count; ++i) {
            const std::int64_t index = std::clamp<std::int64_t>(run.first + i, 0, s.sourceCount - 1);
            sum.add(load(from + index * 4), run.weights[i]);
        }
        store(to, sum.average(reciprocal));
    }
}

void sampleBox(RasterRows<std::uint8_t> to, RasterRows<const std::uint8_t> from, std::size_t rows, Sampling s,
               std::size_t count) {
    for (; rows > 0; --rows, to.data += to.bytesPerRow, from.data += from.bytesPerRow)
        sampleBoxRow(to.data, from.data, s, count);
}

void averageRows(std::uint8_t* to, const std::uint8_t* const* rows, const BoxRun& run, std::uint32_t step,
                 std::size_t count) {
    const std::uint64_t reciprocal = BoxSum::reciprocalOf(step);
    for (std::size_t at = 0; at < count * pixelBytes; at += pixelBytes) {
        BoxSum sum;
        for (int i = 0; i < run.count; ++i)
            sum.add(load(rows[i] + at), run.weights[i]);
        store(to + at, sum.average(reciprocal));
    }
}

} // namespace

BoxRun boxRun(std::int64_t position, std::uint32_t step) {
    BoxRun run{position >> 16, 0, {}};
    std::uint32_t remaining = step;
    const auto add = [&run](std::uint32_t weight) {
        if (run.count < BoxRun::maximum) run.weights[run.count++] = static_cast<std::uint8_t>(weight);
    };
    if (const auto part = static_cast<std::uint32_t>((0x10000 - (position & 0xFFFF)) & 0xFFFF); part != 0) {
        add(part >> 8);
        remaining -= part;
    }
    for (; remaining >= 0x10000 && run.count < BoxRun::maximum; remaining -= 0x10000)
        add(255);
    if (remaining > 0) add((remaining & 0xFFFF) >> 8);
    return run;
}

extern constexpr RowOps scalarRowOps{"scalar",      permute, premultiply,  unpremultiply, multiply,   blend,
                                     sampleNearest, nullptr, sampleLinear, sampleBox,     averageRows};

const RowOps& rowOps() {
    static const RowOps& fastest = *availableRowOps().back();
    return fastest;
}

} // namespace raster
