#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>

/// Arithmetic on pixels as words of four 8-bit channels, two channels to a multiplication.
namespace raster {

constexpr std::uint32_t evenChannels = 0x00FF00FF;

inline std::uint32_t load(const std::uint8_t* from) {
    std::uint32_t word = 0;
    std::memcpy(&word, from, sizeof word);
    return word;
}

inline void store(std::uint8_t* to, std::uint32_t word) {
    std::memcpy(to, &word, sizeof word);
}

/// Each channel (a * (255 - weight) + b * weight) >> 8, not rounded: flat colours come out darker by up to 1.
inline std::uint32_t blendWords(std::uint32_t a, std::uint32_t b, std::uint32_t weight) {
    const std::uint32_t rest = 255 - weight;
    const std::uint32_t even = (a & evenChannels) * rest + (b & evenChannels) * weight;
    const std::uint32_t odd = (a >> 8 & evenChannels) * rest + (b >> 8 & evenChannels) * weight;
    return (even >> 8 & evenChannels) | (odd & ~evenChannels);
}

/// The sum of up to 32 weighted pixels, and its average by a step in 16.16.
class BoxSum {
public:
    /// Each product loses its low byte before it is added, not the sum.
    void add(std::uint32_t word, std::uint32_t weight) {
        m_even += (word & evenChannels) * weight >> 8 & evenChannels;
        m_odd += (word >> 8 & evenChannels) * weight >> 8 & evenChannels;
    }
    /// floor(sum * 65536 / step) for each channel, `reciprocal` being that of the step.
    std::uint32_t average(std::uint64_t reciprocal) const {
        const auto channel = [reciprocal](std::uint32_t sum) {
            return static_cast<std::uint32_t>((sum & 0xFFFF) * reciprocal >> 45);
        };
        return channel(m_even) | channel(m_odd) << 8 | channel(m_even >> 16) << 16 |
               channel(m_odd >> 16) << 24;
    }
    /// Exact under `average`: a sum is at most 32 * 254 < 2^13, so the error stays below 2^13 / 2^45 = 1 /
    /// 2^32.
    static std::uint64_t reciprocalOf(std::uint32_t step) { return ((1ULL << 61) + step - 1) / step; }

private:
    std::uint32_t m_even = 0;
    std::uint32_t m_odd = 0;
};

/// The source index of a 16.16 position.
inline std::int64_t indexAt(std::int64_t position, std::int64_t count) {
    return std::clamp<std::int64_t>(position >> 16, 0, count - 1);
}

/// The weight of the second of two neighbours; of a negative position, that of its two's complement.
inline std::uint8_t weightAt(std::int64_t position) {
    return static_cast<std::uint8_t>((position & 0xFFFF) >> 8);
}

} // namespace raster
