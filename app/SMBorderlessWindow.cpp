#include "app/SMBorderlessWindow.h"

#include "app/SMThemeView.h"
#include "lib/base/Geometry.h"
#include "platform/WindowServer.h"

#include "app/menuBackground.h"

#include <functional>
#include <utility>

namespace {

/// Of the process, not of the window: a second window gets no filter.
bool windowFilterAdded = false; // NOLINT(*-non-const-global-variables)

} // namespace

SMBorderlessWindow::SMBorderlessWindow(platform::WindowServer& server, SMThemeView& contentView,
                                       std::function<KXRect()> ownArea)
    : m_server(server)
    , m_contentView(contentView)
    , m_panel(server.makePanel(contentView, *this, std::move(ownArea))) {}

void SMBorderlessWindow::makeKeyAndOrderFront() {
    const bool hasFilter = m_server.hasWindowFilter();
    if (hasFilter)
        m_contentView.setBackgroundImage({});
    else if (!isVisible()) // else it would see itself
        m_contentView.setBackgroundImage(menuBackground(m_panel->screenBelow()));
    m_panel->makeKeyAndOrderFront();
    if (!hasFilter || windowFilterAdded) return;
    m_panel->addWindowFilter();
    windowFilterAdded = true;
}

void SMBorderlessWindow::panelDidResignKey() {
    if (m_delegate) m_delegate->windowDidResignKey();
}

void SMBorderlessWindow::panelFlagsChanged(bool optionDown) {
    if (m_delegate) m_delegate->flagsChanged(optionDown);
}
