#pragma once

#include <cstdint>
#include <span>
#include <vector>

/// What follows from a window manager's properties. Pure functions.
namespace platform {

/// A window of the process that is to come to the front.
struct WindowFacts {
    std::uint32_t window = 0;
    bool isHidden = false;    ///< minimised
    bool isElsewhere = false; ///< on another desktop
    bool isFurniture = false; ///< a bar, or the desktop itself
};

/// Those to be raised, from the lowest to the front one, which comes last and gets the keyboard: if possible
/// one that can be seen now. Without a window but furniture there is nothing to raise.
std::vector<std::uint32_t> WindowsToRaise(std::span<const WindowFacts> bottomToTop);

struct DesktopGrid {
    unsigned columns = 1;
    unsigned rows = 1;
    friend bool operator==(const DesktopGrid&, const DesktopGrid&) = default;
};

/// How desktops are laid out: `layout` is the property of that name (orientation, columns, rows, …), which
/// leaves the one or the other to be worked out, or nothing. Without it they stand in a row.
DesktopGrid GridOfDesktops(std::span<const std::uint32_t> layout, std::uint32_t desktops);

} // namespace platform
