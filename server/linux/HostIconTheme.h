#pragma once

#include "server/icons/ThemeIcons.h"

namespace tessel {

/// The icon theme that this desktop's user has chosen, and where themes lie. Any thread.
ThemeIcons::Places HostIconPlaces();

} // namespace tessel
