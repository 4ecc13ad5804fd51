#include "platform/linux/WindowChoice.h"

#include <algorithm>
#include <cstdint>
#include <span>
#include <vector>

namespace platform {

std::vector<std::uint32_t> WindowsToRaise(std::span<const WindowFacts> bottomToTop) {
    // What is less of a bother to the user counts for more.
    const auto rank = [](const WindowFacts& facts) {
        return facts.isFurniture ? 0 : 4 - 2 * int{facts.isHidden} - int{facts.isElsewhere};
    };
    const WindowFacts* front = nullptr;
    for (const auto& facts : bottomToTop)
        if (rank(facts) > 0 && (!front || rank(facts) >= rank(*front))) front = &facts;
    std::vector<std::uint32_t> windows;
    if (!front) return windows;
    for (const auto& facts : bottomToTop)
        if (!facts.isFurniture && !facts.isHidden && &facts != front) windows.push_back(facts.window);
    windows.push_back(front->window);
    return windows;
}

DesktopGrid GridOfDesktops(std::span<const std::uint32_t> layout, std::uint32_t desktops) {
    // A window manager may say anything.
    constexpr std::uint32_t most = 1024;
    const std::uint32_t count = std::clamp(desktops, 1u, most);
    const std::uint32_t columns = layout.size() >= 3 ? std::min(layout[1], most) : 0;
    const std::uint32_t rows = layout.size() >= 3 ? std::min(layout[2], most) : 0;
    if (columns > 0 && rows > 0) return {columns, rows};
    if (columns > 0) return {columns, (count + columns - 1) / columns};
    if (rows > 0) return {(count + rows - 1) / rows, rows};
    return {count, 1};
}

} // namespace platform
