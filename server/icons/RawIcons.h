#pragma once

#include "lib/plist/Value.h"

#include <array>
#include <span>

class QImage;

namespace tessel {

/// The sizes at which the menu gets its icons, in pixels.
inline constexpr std::array iconSizes{16, 32, 48, 128};

/// A raw icon set: an array of dictionaries "format", "width", "height", "data", with straight alpha and the
/// bottom row first. Null images and second ones of the same size are passed over; nil when none is left.
plist::Value RawIconSet(std::span<const QImage> images);

} // namespace tessel
