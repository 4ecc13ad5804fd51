#pragma once

#include "platform/Workspace.h"
#include "platform/linux/WindowChoice.h"

#include <optional>

namespace platform {

/// What the window manager of $DISPLAY writes on its root window. Connects for the length of each call, so
/// that a display may come and go; needs no toolkit.
class EwmhWorkspace final : public Workspace {
public:
    int frontProcessID() const override;
    Status bringToFront(int pid, ProcessWindows windows) const override;
    Status currentDesktop(unsigned& number) const override;

    /// Nothing when nobody tells.
    std::optional<DesktopGrid> desktopGrid() const;
};

} // namespace platform
