#pragma once

#include "platform/UserDefaults.h"
#include "platform/linux/PlistUserDefaults.h"
#include "platform/linux/WindowChoice.h"

#include <functional>
#include <optional>
#include <string>
#include <utility>

namespace platform {

/// The domain "com.apple.dock". When its file does not say whether there are "workspaces", the desktop does,
/// and says how they are laid out.
class DockDefaults final : public UserDefaults {
public:
    using Desktops = std::function<std::optional<DesktopGrid>()>;

    explicit DockDefaults(Desktops desktops)
        : m_desktops(std::move(desktops)) {}

    int integerForKey(std::string_view key) const override;

private:
    PlistUserDefaults m_file{"com.apple.dock"};
    Desktops m_desktops;
};

} // namespace platform
