#include "platform/linux/XcbConnection.h"
#include "platform/linux/XcbCalls.h"

#include <QGuiApplication>
#include <QtGui/qguiapplication_platform.h>
#include <cstring>
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
    const auto cookie = xcb_get_property(c, 0, XcbRootWindow(c), XcbAtom(c, property), XCB_ATOM_WINDOW, 0, 1);
    const XcbReply<xcb_get_property_reply_t> reply(xcb_get_property_reply(c, cookie, nullptr));
    xcb_window_t window = XCB_WINDOW_NONE;
    if (reply && xcb_get_property_value_length(reply.get()) >= static_cast<int>(sizeof window))
        std::memcpy(&window, xcb_get_property_value(reply.get()), sizeof window);
    return window;
}

} // namespace platform
