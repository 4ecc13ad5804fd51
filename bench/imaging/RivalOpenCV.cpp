#include "bench/imaging/Jobs.h"

#include <memory>
#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>

namespace {

cv::Mat viewOf(const Pixels& pixels) {
    return {pixels.height, pixels.width, CV_8UC4, const_cast<std::uint8_t*>(pixels.data())};
}

auto scaling(int interpolation) {
    return [interpolation](const Pixels& from, Pixels& to) {
        cv::Mat target = viewOf(to);
        cv::resize(viewOf(from), target, target.size(), 0, 0, interpolation);
    };
}

void add() {
    cv::setNumThreads(1);
    measureScalings("enlarge", enlargements, "OpenCV", scaling(cv::INTER_LINEAR));
    measureScalings("reduce", reductions, "OpenCV", scaling(cv::INTER_AREA));
    measureScalings("nearest", nearestScalings, "OpenCV", scaling(cv::INTER_NEAREST));
}

const Registration registration(add);

} // namespace
