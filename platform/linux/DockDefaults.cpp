#include "platform/linux/DockDefaults.h"

#include "platform/linux/WindowChoice.h"

#include <string_view>

namespace platform {

int DockDefaults::integerForKey(std::string_view key) const {
    if (m_file.holds("workspaces") || !key.starts_with("workspaces")) return m_file.integerForKey(key);
    const DesktopGrid grid = m_desktops().value_or(DesktopGrid{});
    if (key == "workspaces-cols") return static_cast<int>(grid.columns);
    if (key == "workspaces-rows") return static_cast<int>(grid.rows);
    return key == "workspaces" && grid != DesktopGrid{} ? 1 : 0;
}

} // namespace platform
