#pragma once

#include "app/SMMenuWindowOutlets.h"
#include "app/SMThemeView.h"
#include "platform/WindowServer.h"

#include <functional>
#include <memory>

/// The menu's panel. Its content view is a theme view.
class SMBorderlessWindow final : private platform::PanelDelegate {
public:
    /// All borrowed. Presses in `ownArea` are not outside of the panel.
    SMBorderlessWindow(platform::WindowServer& server, SMThemeView& contentView,
                       std::function<KXRect()> ownArea);

    void setDelegate(SMMenuWindowEvents* delegate) { m_delegate = delegate; }

    KXRect frame() const { return m_panel->frame(); }
    void setFrame(const KXRect& frame) { m_panel->setFrame(frame); }
    bool isVisible() const { return m_panel->isVisible(); }
    /// With a fresh background.
    void makeKeyAndOrderFront();
    void orderOut() { m_panel->orderOut(); }

private:
    void panelDidResignKey() override;
    void panelFlagsChanged(bool optionDown) override;

    platform::WindowServer& m_server;
    SMThemeView& m_contentView;
    SMMenuWindowEvents* m_delegate = nullptr;
    std::unique_ptr<platform::PanelWindow> m_panel;
};
