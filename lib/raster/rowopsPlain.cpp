#include "lib/raster/rowops.h"

namespace raster {

std::span<const RowOps* const> availableRowOps() {
    static constexpr const RowOps* all[] = {&scalarRowOps};
    return all;
}

} // namespace raster
