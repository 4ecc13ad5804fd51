#pragma once

#include <cstdint>

namespace platform {

/// What the X server's clock says, in milliseconds, as its events have it. 0, which stands for now in
/// requests, where it does not tell.
std::uint32_t XcbServerTime();

/// Causes an event that says the time to window managers. Some take the last one that they saw for the time,
/// and what they ask for as of then is refused if it is older than what was done since.
void XcbAnnounceServerTime();

} // namespace platform
