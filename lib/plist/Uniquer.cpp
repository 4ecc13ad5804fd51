#include "lib/plist/Uniquer.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <random>
#include <span>

namespace plist {

namespace {

std::uint64_t seed() {
    static const std::uint64_t seed = std::uint64_t{std::random_device()()} << 32 | std::random_device()();
    return seed;
}

std::uint64_t mix(std::uint64_t hash, std::uint64_t word) {
    hash = (hash ^ word) * 0x9E3779B97F4A7C15;
    return hash ^ hash >> 32;
}

template <class Word>
std::uint64_t load(const std::byte* bytes) {
    Word word = 0;
    std::memcpy(&word, bytes, sizeof word);
    return word;
}

/// All of up to 8 bytes in one word; that some may be in it twice does no harm beside the size.
std::uint64_t loadFew(const std::byte* bytes, std::size_t size) {
    if (size >= 4) return load<std::uint32_t>(bytes) << 32 | load<std::uint32_t>(bytes + size - 4);
    if (size >= 2) return load<std::uint16_t>(bytes) << 16 | load<std::uint16_t>(bytes + size - 2);
    return size == 1 ? load<std::uint8_t>(bytes) : 0;
}

} // namespace

std::uint64_t hashOf(std::span<const std::byte> bytes) {
    std::uint64_t hash = mix(seed(), bytes.size());
    for (; bytes.size() > 8; bytes = bytes.subspan(8))
        hash = mix(hash, load<std::uint64_t>(bytes.data()));
    return mix(hash, loadFew(bytes.data(), bytes.size()));
}

std::uint64_t sampledHashOf(std::span<const std::byte> bytes) {
    constexpr std::size_t kSamples = 8;
    if (bytes.size() <= 8 * kSamples) return hashOf(bytes);
    std::uint64_t hash = mix(seed(), bytes.size());
    // Not the ends: the corners of most icons are empty.
    const std::size_t step = (bytes.size() - 8) / kSamples;
    for (std::size_t i = 0; i < kSamples; ++i)
        hash = mix(hash, load<std::uint64_t>(bytes.data() + step / 2 + i * step));
    return hash;
}

std::uint64_t hashOf(const void* place, std::size_t size) {
    return mix(mix(seed(), reinterpret_cast<std::uintptr_t>(place)), size);
}

} // namespace plist
