#include "platform/linux/XcbConnection.h"

#include <QGuiApplication>
#include <QtGui/qguiapplication_platform.h>
#include <array>
#include <cstdint>
#include <cstring>
#include <functional>
#include <map>
#include <string>
#include <xcb/xcb.h>
#include <xcb/xproto.h>

namespace platform {

xcb_connection_t* XcbConnection() {
    const auto* x11 = qGuiApp->nativeInterface<QNativeInterface::QX11Application>();
    return x11 ? x11->connection() : nullptr;
}

xcb_window_t XcbRootWindow(xcb_connection_t* connection) {
    return xcb_setup_roots_iterator(xcb_get_setup(connection)).data->root;
}

xcb_atom_t XcbAtom(xcb_connection_t* connection, const char* name) {
    static std::map<std::string, xcb_atom_t, std::less<>> known; // asking the server is a round trip
    const auto found = known.find(name);
    if (found != known.end()) return found->second;
    const auto cookie = xcb_intern_atom(connection, 0, static_cast<std::uint16_t>(std::strlen(name)), name);
    const XcbReply<xcb_intern_atom_reply_t> reply(xcb_intern_atom_reply(connection, cookie, nullptr));
    return reply ? known.emplace(name, reply->atom).first->second : xcb_atom_t{XCB_ATOM_NONE};
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

void XcbSendToRoot(xcb_connection_t* connection, xcb_window_t window, const char* type,
                   const std::array<std::uint32_t, 5>& data) {
    xcb_client_message_event_t event{};
    event.response_type = XCB_CLIENT_MESSAGE;
    event.format = 32;
    event.window = window;
    event.type = XcbAtom(connection, type);
    std::memcpy(event.data.data32, data.data(), sizeof event.data.data32);
    xcb_send_event(connection, 0, XcbRootWindow(connection),
                   XCB_EVENT_MASK_SUBSTRUCTURE_NOTIFY | XCB_EVENT_MASK_SUBSTRUCTURE_REDIRECT,
                   reinterpret_cast<const char*>(&event));
}

} // namespace platform
