#include "bench/imaging/Jobs.h"

#include <cstring>
#include <libyuv.h>
#include <memory>

namespace {

/// BGRA in memory is its ARGB; its BGRA is A, R, G, B in memory.
void decode(const Pixels& from, Pixels& to) {
    libyuv::ARGBToBGRA(from.data(), from.bytesPerRow(), to.data(), to.bytesPerRow(), from.width,
                       -from.height);
}

auto scaling(libyuv::FilterMode mode) {
    return [mode](const Pixels& from, Pixels& to) {
        libyuv::ARGBScale(from.data(), from.bytesPerRow(), from.width, from.height, to.data(),
                          to.bytesPerRow(), to.width, to.height, mode);
    };
}

using Attenuation = int (*)(const std::uint8_t*, int, std::uint8_t*, int, int, int);

void measureAlpha(const std::string& job, int side, Pixels::Alpha alpha, Attenuation attenuation) {
    auto original = std::make_shared<Pixels>(side, side);
    auto pixels = std::make_shared<Pixels>(side, side);
    original->randomise(alpha);
    measure(job + " " + std::to_string(side), "libyuv", [=] {
        std::memcpy(pixels->data(), original->data(), original->size());
        attenuation(pixels->data(), pixels->bytesPerRow(), pixels->data(), pixels->bytesPerRow(), side, side);
    });
}

void add() {
    for (int side : decodeSides)
        measureScalings("decode", {{side, side, side, side}}, "libyuv", decode);
    measureScalings("enlarge", enlargements, "libyuv", scaling(libyuv::kFilterBilinear));
    measureScalings("reduce", reductions, "libyuv", scaling(libyuv::kFilterBox));
    measureScalings("nearest", nearestScalings, "libyuv", scaling(libyuv::kFilterNone));
    for (int side : alphaSides)
        for (const auto& [alpha, name] : {std::pair{Pixels::Alpha::random, "random alpha"},
                                          {Pixels::Alpha::iconLike, "icon-like alpha"}}) {
            const std::string with = std::string(" ") + name;
            measureAlpha("copy and premultiply" + with, side, alpha, libyuv::ARGBAttenuate);
            measureAlpha("copy and unpremultiply" + with, side, alpha, libyuv::ARGBUnattenuate);
        }
}

const Registration registration(add);

} // namespace
