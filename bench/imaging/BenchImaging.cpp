#include "bench/imaging/Jobs.h"
#include "lib/raster/rasterScale.h"
#include "lib/raster/rasterops.h"

#include <QImage>
#include <QThreadPool>
#include <cstring>
#include <memory>

namespace {

RasterBlock blockOf(Pixels& pixels) {
    return {pixels.data(), pixels.bytesPerRow(), static_cast<std::size_t>(pixels.width),
            static_cast<std::size_t>(pixels.height)};
}

void scale(const Pixels& from, Pixels& to, int filter) {
    Raster_Scale(to.data(), to.bytesPerRow(), 32, 32, to.width, to.height, 1,
                 RasterRect::fromSize(0, 0, to.width, to.height), from.data(), from.bytesPerRow(), 32, 32, 0,
                 from.width, from.height, 1, static_cast<double>(to.width) / from.width,
                 static_cast<double>(to.height) / from.height, filter);
}

void copyFlipped(const Pixels& from, Pixels& to) {
    Raster_PermuteFlipped(blockOf(to), from.data(), from.bytesPerRow(), rasterBGRAToARGB);
}

void copy(const Pixels& from, Pixels& to) {
    std::memcpy(to.data(), from.data(), from.size());
}

void addDecoding() {
    auto ours = std::make_shared<std::vector<std::pair<Pixels, Pixels>>>();
    for (int side : {16, 32, 48, 128})
        ours->emplace_back(Pixels(side, side).randomise(), Pixels(side, side));
    measure("icon set", "ours", [ours] {
        for (auto& [from, to] : *ours)
            copyFlipped(from, to);
    });
    measure("icon set", "memcpy", [ours] {
        for (auto& [from, to] : *ours)
            copy(from, to);
    });
    for (int side : decodeSides) {
        const std::vector<Sizes> sizes{{side, side, side, side}};
        measureScalings("decode", sizes, "ours", copyFlipped);
        measureScalings("decode", sizes, "memcpy", copy);
    }
}

/// In place, on pixels that are put back before each round; the putting back is measured apart as "memcpy".
void measureInPlace(const std::string& job, int side, Pixels::Alpha alpha, const std::string& who,
                    void (*work)(Pixels&)) {
    auto original = std::make_shared<Pixels>(side, side);
    auto pixels = std::make_shared<Pixels>(side, side);
    original->randomise(alpha);
    *pixels = *original;
    measure(job + " " + std::to_string(side), who, [original, pixels, work] {
        copy(*original, *pixels);
        work(*pixels);
    });
}

void addAlpha() {
    for (int side : alphaSides) {
        for (const auto& [alpha, name] : {std::pair{Pixels::Alpha::random, "random alpha"},
                                          {Pixels::Alpha::iconLike, "icon-like alpha"}}) {
            const std::string with = std::string(" ") + name;
            measureInPlace("copy and premultiply" + with, side, alpha, "ours",
                           [](Pixels& p) { Raster_Premultiply(blockOf(p), 3); });
            measureInPlace("copy and unpremultiply" + with, side, alpha, "ours",
                           [](Pixels& p) { Raster_Unpremultiply(blockOf(p), 3); });
            measureInPlace("copy and premultiply" + with, side, alpha, "one in-place pass",
                           [](Pixels& p) { Raster_Permute(blockOf(p), rasterBGRAToARGB); });
            measureInPlace("copy and premultiply" + with, side, alpha, "nothing", [](Pixels&) {});
            measureInPlace("copy and unpremultiply" + with, side, alpha, "nothing", [](Pixels&) {});
        }
    }
}

void addScaling() {
    const auto filtered = [](const Pixels& from, Pixels& to) { scale(from, to, 2); };
    const auto nearest = [](const Pixels& from, Pixels& to) { scale(from, to, 0); };
    measureScalings("enlarge", enlargements, "ours", filtered);
    measureScalings("reduce", reductions, "ours", filtered);
    measureScalings("nearest", nearestScalings, "ours", nearest);
    const auto qt = [](Qt::TransformationMode mode) {
        return [mode](const Pixels& from, Pixels& to) {
            const QImage image(from.data(), from.width, from.height, QImage::Format_ARGB32_Premultiplied);
            benchmark::DoNotOptimize(image.scaled(to.width, to.height, Qt::IgnoreAspectRatio, mode));
        };
    };
    measureScalings("enlarge", enlargements, "QImage", qt(Qt::SmoothTransformation));
    measureScalings("reduce", reductions, "QImage", qt(Qt::SmoothTransformation));
    measureScalings("nearest", nearestScalings, "QImage", qt(Qt::FastTransformation));
}

void addMultiply() {
    auto badge = std::make_shared<Pixels>(256, 256);
    auto document = std::make_shared<Pixels>(512, 512);
    auto spare = std::make_shared<Pixels>(256, 256);
    badge->randomise();
    document->randomise();
    measure("multiply 256 onto 512", "ours", [badge, document] {
        Raster_Multiply({document->data() + 128 * 2048 + 512, 2048, 256, 256}, {true, false}, badge->data(),
                        1024, {true, false});
    });
    measure("multiply 256 onto 512", "memcpy", [badge, spare] { copy(*badge, *spare); });
}

const Registration decoding(addDecoding);
const Registration alpha(addAlpha);
const Registration scaling(addScaling);
const Registration multiplying(addMultiply);

} // namespace

// QImage spreads a scaling over the threads of this pool, except when it is called on one of them.
int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    QThreadPool::globalInstance()->start([] { benchmark::RunSpecifiedBenchmarks(); });
    QThreadPool::globalInstance()->waitForDone();
}
