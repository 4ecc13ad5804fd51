#include "bench/imaging/Jobs.h"

#include <memory>
#include <pixman.h>

namespace {

struct Unreferenced {
    void operator()(pixman_image_t* image) const { pixman_image_unref(image); }
};
using Image = std::unique_ptr<pixman_image_t, Unreferenced>;

Image imageOf(const Pixels& pixels) {
    return Image(pixman_image_create_bits(
        PIXMAN_a8r8g8b8, pixels.width, pixels.height,
        reinterpret_cast<std::uint32_t*>(const_cast<std::uint8_t*>(pixels.data())), pixels.bytesPerRow()));
}

auto scaling(pixman_filter_t filter) {
    return [filter](const Pixels& from, Pixels& to) {
        const Image source = imageOf(from);
        const Image target = imageOf(to);
        pixman_transform_t transform;
        pixman_transform_init_scale(&transform,
                                    pixman_double_to_fixed(static_cast<double>(from.width) / to.width),
                                    pixman_double_to_fixed(static_cast<double>(from.height) / to.height));
        pixman_image_set_transform(source.get(), &transform);
        pixman_image_set_filter(source.get(), filter, nullptr, 0);
        pixman_image_set_repeat(source.get(), PIXMAN_REPEAT_PAD);
        pixman_image_composite32(PIXMAN_OP_SRC, source.get(), nullptr, target.get(), 0, 0, 0, 0, 0, 0,
                                 to.width, to.height);
    };
}

void add() {
    measureScalings("enlarge", enlargements, "pixman", scaling(PIXMAN_FILTER_BILINEAR));
    measureScalings("nearest", nearestScalings, "pixman", scaling(PIXMAN_FILTER_NEAREST));
}

const Registration registration(add);

} // namespace
