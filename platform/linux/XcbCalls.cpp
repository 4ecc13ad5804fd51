#include "platform/linux/XcbCalls.h"

#include <array>
#include <cstdint>
#include <cstring>
#include <functional>
#include <map>
#include <string>
#include <xcb/xcb.h>
#include <xcb/xproto.h>

namespace platform {

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
