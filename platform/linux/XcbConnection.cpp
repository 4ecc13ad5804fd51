#include "platform/linux/XcbConnection.h"

#include "platform/linux/XcbCalls.h"

#include <QGuiApplication>
#include <QtGui/qguiapplication_platform.h>
#include <xcb/xcb.h>
#include <xcb/xproto.h>

namespace platform {

xcb_connection_t* XcbConnection() {
    const auto* x11 = qGuiApp->nativeInterface<QNativeInterface::QX11Application>();
    return x11 ? x11->connection() : nullptr;
}

xcb_window_t XcbWindowNamedByRoot(const char* property) {
    auto* c = XcbConnection();
    if (!c) return XCB_WINDOW_NONE;
    return XcbNumber(c, XcbRootWindow(c), property).value_or(XCB_WINDOW_NONE);
}

} // namespace platform
