#include "lib/plist/Uniquer.h"

#include <cstdint>
#include <random>

namespace plist {

std::uint64_t Hash::seed() {
    static const std::uint64_t seed = std::uint64_t{std::random_device()()} << 32 | std::random_device()();
    return seed;
}

} // namespace plist
