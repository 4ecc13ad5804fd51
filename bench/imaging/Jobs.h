#pragma once

#include <benchmark/benchmark.h>
#include <cstdint>
#include <functional>
#include <memory>
#include <random>
#include <string>
#include <vector>

/// Pixels for one side of a job, in whole cache lines as bitmaps have them.
struct Pixels {
    struct alignas(64) Line {
        std::uint8_t bytes[64];
    };
    int width;
    int height;
    std::vector<Line> lines;

    Pixels(int w, int h)
        : width(w)
        , height(h)
        , lines((size() + sizeof(Line) - 1) / sizeof(Line)) {}
    int bytesPerRow() const { return width * 4; }
    std::size_t size() const {
        return static_cast<std::size_t>(width) * static_cast<std::size_t>(height) * 4;
    }
    std::uint8_t* data() { return lines.front().bytes; }
    const std::uint8_t* data() const { return lines.front().bytes; }

    enum class Alpha { random, iconLike };
    Pixels& randomise(Alpha alpha = Alpha::random) {
        std::mt19937 random(7);
        for (std::size_t i = 0; i < size(); i += 4) {
            const auto word = static_cast<std::uint32_t>(random());
            // An icon is clear around, opaque inside, and something else on its outline only.
            const auto column = static_cast<int>(i / 4) % width;
            const bool outline = column % 32 == 6 || column % 32 == 25;
            const auto iconAlpha = outline ? word >> 24 : column % 32 > 6 && column % 32 < 25 ? 255U : 0U;
            const unsigned a = alpha == Alpha::iconLike ? iconAlpha : word >> 24;
            for (unsigned c = 0; c < 3; ++c)
                data()[i + c] = static_cast<std::uint8_t>((word >> (8 * c) & 255) * a / 255);
            data()[i + 3] = static_cast<std::uint8_t>(a);
        }
        return *this;
    }
};

/// Measures `work` as "job/who". `work` must leave its inputs fit for the next round.
inline void measure(const std::string& job, const std::string& who, std::function<void()> work) {
    benchmark::RegisterBenchmark((job + "/" + who).c_str(),
                                 [work = std::move(work)](benchmark::State& state) {
                                     for (auto _ : state) {
                                         work();
                                         benchmark::ClobberMemory();
                                     }
                                 });
}

struct Sizes {
    int fromWidth, fromHeight, toWidth, toHeight;
    std::string name() const {
        return std::to_string(fromWidth) + "x" + std::to_string(fromHeight) + " to " +
               std::to_string(toWidth) + "x" + std::to_string(toHeight);
    }
};

inline const std::vector<int> decodeSides{16, 32, 48, 128, 256, 512};
inline const std::vector<int> alphaSides{128, 256, 512};
inline const std::vector<Sizes> enlargements{
    {128, 128, 256, 256}, {256, 256, 512, 512}, {100, 80, 333, 257}, {512, 512, 2048, 2048}};
inline const std::vector<Sizes> reductions{{512, 512, 128, 128}, {1024, 1024, 100, 100}, {333, 257, 100, 80}};
inline const std::vector<Sizes> nearestScalings{{256, 256, 512, 512}, {512, 512, 200, 200}};

/// For each of `sizes`: `scale(from, to)` under "job sizes/who". The pixels live as long as the process.
template <typename Scale>
void measureScalings(const std::string& job, const std::vector<Sizes>& sizes, const std::string& who,
                     Scale scale) {
    for (const Sizes& s : sizes) {
        auto from = std::make_shared<Pixels>(s.fromWidth, s.fromHeight);
        auto to = std::make_shared<Pixels>(s.toWidth, s.toHeight);
        from->randomise();
        measure(job + " " + s.name(), who, [from, to, scale] { scale(*from, *to); });
    }
}

/// The jobs of one side each add theirs before main.
struct Registration {
    explicit Registration(void (*add)()) { add(); }
};
