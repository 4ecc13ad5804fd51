#pragma once

#include "lib/base/Geometry.h"

#include <optional>

/// Geometry of status items and of the panel that hangs from one. y upwards throughout.
namespace platform {

/// Where a panel goes that is wanted at `wanted`: right below `item`, its right edge one point past the
/// item's. Exactly there, if that is in `available`; that one point may leave it. Else mirrored at the item:
/// above it, or with the left edges together; else shifted in. Right to left, the left edges come first.
/// As long as the item has no place (no width): in the upper corner where bars have their items.
KXRect PlacePanel(const KXRect& wanted, const KXRect& item, const KXRect& available, bool rightToLeft);

/// What a panel at the item may take of `available`: the larger part above or below an item that stands in
/// it, all of it where the item stands in a bar or there is none.
KXRect RoomAtItem(const KXRect& item, const KXRect& available);

/// The frame of an item whose host tells only where it was clicked. An item in a bar, which is what
/// `available` leaves of `screen`, reaches across the bar. Before the first click: at the right end of the
/// bar at the top, or at the bottom if only there is one.
KXRect StatusItemFrameAt(std::optional<KXPoint> click, KXSize size, const KXRect& screen,
                         const KXRect& available);

} // namespace platform
