#include "platform/linux/XcbDockWindow.h"

#include "platform/linux/XcbCalls.h"
#include "platform/linux/XcbConnection.h"

#include <QWidget>
#include <array>
#include <cstdint>
#include <xcb/xcb.h>
#include <xcb/xproto.h>

namespace platform {

namespace {

constexpr std::uint32_t allWorkspaces = 0xFFFFFFFF;

xcb_window_t nativeWindow(const QWidget& window) {
    return static_cast<xcb_window_t>(window.winId());
}

} // namespace

void MakeDockWindow(QWidget& window) {
    window.winId();
    // Set before the native window exists, the attribute would be lost.
    window.setAttribute(Qt::WA_X11NetWmWindowTypeDock);
    auto* c = XcbConnection();
    if (!c) return;
    const std::array states = {XcbAtom(c, "_NET_WM_STATE_STICKY"), XcbAtom(c, "_NET_WM_STATE_SKIP_TASKBAR"),
                               XcbAtom(c, "_NET_WM_STATE_SKIP_PAGER")};
    xcb_change_property(c, XCB_PROP_MODE_REPLACE, nativeWindow(window), XcbAtom(c, "_NET_WM_STATE"),
                        XCB_ATOM_ATOM, 32, states.size(), states.data());
}

void PutOnAllWorkspaces(QWidget& window) {
    auto* c = XcbConnection();
    if (!c) return;
    constexpr std::uint32_t add = 1;
    constexpr std::uint32_t fromPager = 2; // requests of plain applications may be refused
    XcbSendToRoot(c, nativeWindow(window), "_NET_WM_STATE",
                  {add, XcbAtom(c, "_NET_WM_STATE_STICKY"), 0, fromPager, 0});
    XcbSendToRoot(c, nativeWindow(window), "_NET_WM_DESKTOP", {allWorkspaces, fromPager, 0, 0, 0});
    xcb_flush(c);
}

} // namespace platform
