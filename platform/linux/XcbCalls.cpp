#include "platform/linux/XcbCalls.h"

#include <array>
#include <cstdint>
#include <cstring>
#include <functional>
#include <map>
#include <optional>
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

xcb_window_t XcbSelectionOwner(xcb_connection_t* connection, const char* selection) {
    const auto cookie = xcb_get_selection_owner(connection, XcbAtom(connection, selection));
    const XcbReply<xcb_get_selection_owner_reply_t> reply(
        xcb_get_selection_owner_reply(connection, cookie, nullptr));
    return reply ? reply->owner : xcb_window_t{XCB_WINDOW_NONE};
}

std::optional<std::uint32_t> XcbNumber(xcb_connection_t* connection, xcb_window_t window,
                                       const char* property) {
    const auto cookie =
        xcb_get_property(connection, 0, window, XcbAtom(connection, property), XCB_ATOM_ANY, 0, 1);
    const XcbReply<xcb_get_property_reply_t> reply(xcb_get_property_reply(connection, cookie, nullptr));
    if (!reply || reply->format != 32 || reply->value_len < 1) return {};
    return *static_cast<const std::uint32_t*>(xcb_get_property_value(reply.get()));
}

void XcbSend(xcb_connection_t* connection, xcb_window_t to, std::uint32_t mask, xcb_window_t window,
             const char* type, const std::array<std::uint32_t, 5>& data) {
    xcb_client_message_event_t event{};
    event.response_type = XCB_CLIENT_MESSAGE;
    event.format = 32;
    event.window = window;
    event.type = XcbAtom(connection, type);
    std::memcpy(event.data.data32, data.data(), sizeof event.data.data32);
    xcb_send_event(connection, 0, to, mask, reinterpret_cast<const char*>(&event));
}

void XcbSendToRoot(xcb_connection_t* connection, xcb_window_t window, const char* type,
                   const std::array<std::uint32_t, 5>& data) {
    XcbSend(connection, XcbRootWindow(connection),
            XCB_EVENT_MASK_SUBSTRUCTURE_NOTIFY | XCB_EVENT_MASK_SUBSTRUCTURE_REDIRECT, window, type, data);
}

} // namespace platform
