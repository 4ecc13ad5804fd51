#pragma once

#include <cstdint>

namespace platform {

/// What the X server's clock says, in milliseconds, as its events have it. 0, which stands for now in
/// requests, where it does not tell.
std::uint32_t XcbServerTime();

} // namespace platform
