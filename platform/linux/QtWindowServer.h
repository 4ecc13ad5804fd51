#pragma once

#include "platform/WindowServer.h"

namespace platform {

/// Panels that the window manager does not manage: only so is their frame exact, Option with a click
/// delivered, and the keyboard theirs at once. Works without a display too, where a panel is a plain hidden
/// window.
class QtWindowServer final : public WindowServer {
public:
    KXRect visibleFrame(const KXRect& item) const override;
    bool hasWindowFilter() const override;
    bool reducesMotion() const override;
    std::unique_ptr<PanelWindow> makePanel(QWidget& contentView, PanelDelegate& delegate,
                                           std::function<KXRect()> ownArea) override;
};

} // namespace platform
