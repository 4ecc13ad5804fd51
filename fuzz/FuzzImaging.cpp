#include "lib/kxAppKit/KXBitmapImageRep.h"
#include "lib/kxAppKit/KXImage.h"
#include "lib/plist/Value.h"
#include "lib/raster/rasterScale.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <vector>

// Raw icon dictionaries, scaler parameters and drawing rectangles, as a hostile peer would send them.

namespace {

/// Values from the input, zeroes once it is used up.
class Input {
public:
    Input(const std::uint8_t* data, std::size_t size)
        : m_data(data)
        , m_left(size) {}

    template <typename Value>
    Value take() {
        Value value{};
        const std::size_t count = std::min(m_left, sizeof value);
        std::memcpy(&value, m_data, count);
        m_data += count;
        m_left -= count;
        return value;
    }
    /// Mostly small, now and then anything.
    std::int32_t number() {
        const auto kind = take<std::uint8_t>();
        return kind < 240 ? kind % 40 : take<std::int32_t>();
    }
    std::int32_t stride() { return std::clamp(number(), -100'000, 100'000) * 4; }
    SharedBytes bytes(std::size_t count) {
        count = std::min(count, m_left);
        const auto copy = SharedBytes::copyOf(m_data, count);
        m_data += count;
        m_left -= count;
        return copy;
    }

private:
    const std::uint8_t* m_data;
    std::size_t m_left;
};

plist::Value icon(Input& input) {
    const std::int32_t width = input.number();
    const std::int32_t height = input.number();
    const bool exact = input.take<std::uint8_t>() % 4 != 0;
    const auto size = static_cast<std::uint32_t>(width) * static_cast<std::uint32_t>(height) * 4;
    std::vector<std::uint8_t> pixels(std::min<std::size_t>(exact ? size : size / 2 + 1, 1 << 20));
    const SharedBytes some = input.bytes(pixels.size());
    std::transform(some.span().begin(), some.span().end(), pixels.begin(),
                   [](std::byte byte) { return std::to_integer<std::uint8_t>(byte); });
    return plist::Dictionary{{"format", input.take<std::uint8_t>() % 16 ? "bgra" : "rgba"},
                             {"width", width},
                             {"height", height},
                             {"data", SharedBytes::copyOf(pixels.data(), pixels.size())}};
}

void useIcons(Input& input) {
    plist::Array icons;
    for (int count = input.take<std::uint8_t>() % 4; count >= 0; --count)
        icons.push_back(icon(input));
    const auto image = KXImage::imageWithRawIcons(icons);
    if (!image) return;
    image->squareImage(std::min(input.number(), 300));
    const float side = static_cast<float>(input.number());
    image->imageByScalingToSize({std::min(side, 300.0F), std::min(input.take<float>(), 300.0F)}, side > 9,
                                static_cast<KXImageInterpolation>(input.take<std::uint8_t>() % 4));
    const auto target = KXBitmapImageRep::imageRepWith32bitBuffer(nullptr, 1 + std::abs(input.number() % 64),
                                                                  1 + std::abs(input.number() % 64),
                                                                  input.take<std::uint8_t>() % 4, 0);
    const KXRect rect{input.take<float>(), input.take<float>(), input.take<float>(), input.take<float>()};
    for (const auto& rep : image->representations()) {
        rep->drawIntoBitmapRep(*target, rect, KXImageInterpolation::high);
        const auto& bitmap = static_cast<const KXBitmapImageRep&>(*rep);
        bitmap.multiplyPixelDataIntoBitmapRep(*target, rect.origin());
        bitmap.copyBitmapDataIntoRep(*target, rect.origin());
    }
    KXBitmapImageRep::imageRepWithData(input.bytes(4096));
}

/// Buffers that are truly as large as their description says, or the call must refuse them.
void useScaler(Input& input) {
    const auto buffer = [](std::int32_t bytesPerRow, std::int32_t height) {
        const std::int64_t size = std::int64_t{bytesPerRow} * height;
        return std::vector<std::uint8_t>(size > 0 && size < (1 << 20) ? static_cast<std::size_t>(size) : 0);
    };
    const std::int32_t toWidth = input.number(), toHeight = input.number(), toStride = input.stride();
    const std::int32_t fromWidth = input.number(), fromHeight = input.number(), fromStride = input.stride();
    auto to = buffer(toStride, toHeight);
    const auto from = buffer(fromStride, fromHeight);
    const int depths[] = {8, 16, 24, 32, input.number()};
    const auto depth = [&] { return depths[input.take<std::uint8_t>() % 5]; };
    const RasterRect rect{input.number(), input.number(), input.number(), input.number()};
    Raster_Scale(to.empty() ? nullptr : to.data(), toStride, depth(), depth(), toWidth, toHeight, 1, rect,
                 from.empty() ? nullptr : from.data(), fromStride, depth(), depth(), 0, fromWidth, fromHeight,
                 1, input.take<double>(), input.take<double>(), input.take<std::uint8_t>() % 2);
}

} // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
    setenv("HOME", "/nonexistent", 1); // what is refused is logged; not on a disk, a million times
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    Input input(data, size);
    input.take<std::uint8_t>() % 2 ? useIcons(input) : useScaler(input);
    return 0;
}
