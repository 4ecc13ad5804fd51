#include "bench/imaging/Jobs.h"

#include <memory>

extern "C" {
#include <libswscale/swscale.h>
}

namespace {

void measureSwscale(const std::string& job, const std::vector<Sizes>& sizes, int flags) {
    for (const Sizes& s : sizes) {
        const std::shared_ptr<SwsContext> context(sws_getContext(s.fromWidth, s.fromHeight, AV_PIX_FMT_BGRA,
                                                                 s.toWidth, s.toHeight, AV_PIX_FMT_BGRA,
                                                                 flags, nullptr, nullptr, nullptr),
                                                  sws_freeContext);
        measureScalings(job, {s}, "swscale", [context](const Pixels& from, Pixels& to) {
            const std::uint8_t* const source[] = {from.data()};
            std::uint8_t* const target[] = {to.data()};
            const int sourceStride[] = {from.bytesPerRow()};
            const int targetStride[] = {to.bytesPerRow()};
            sws_scale(context.get(), source, sourceStride, 0, from.height, target, targetStride);
        });
    }
}

void add() {
    measureSwscale("enlarge", enlargements, SWS_BILINEAR);
    measureSwscale("reduce", reductions, SWS_AREA);
    measureSwscale("nearest", nearestScalings, SWS_POINT);
}

const Registration registration(add);

} // namespace
