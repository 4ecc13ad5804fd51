#include "platform/linux/EwmhDisplay.h"

#include "platform/linux/XcbCalls.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <span>
#include <utility>
#include <vector>
#include <xcb/res.h>
#include <xcb/xcb.h>
#include <xcb/xproto.h>

namespace platform {

namespace {

constexpr std::array<const char*, EwmhDisplay::nameCount> names = {"_NET_ACTIVE_WINDOW",
                                                                   "_NET_CLIENT_LIST_STACKING",
                                                                   "_NET_CURRENT_DESKTOP",
                                                                   "_NET_NUMBER_OF_DESKTOPS",
                                                                   "_NET_DESKTOP_LAYOUT",
                                                                   "_NET_SUPPORTED",
                                                                   "_NET_RESTACK_WINDOW",
                                                                   "_NET_WM_PID",
                                                                   "_NET_WM_DESKTOP",
                                                                   "_NET_WM_STATE",
                                                                   "_NET_WM_STATE_HIDDEN",
                                                                   "_NET_WM_WINDOW_TYPE",
                                                                   "_NET_WM_WINDOW_TYPE_DESKTOP",
                                                                   "_NET_WM_WINDOW_TYPE_DOCK"};

constexpr std::uint32_t longestProperty = 1 << 16; ///< in words

} // namespace

EwmhDisplay::EwmhDisplay() {
    int screen = 0;
    m_connection.reset(xcb_connect(nullptr, &screen));
    auto* c = m_connection.get();
    if (xcb_connection_has_error(c)) return;
    auto roots = xcb_setup_roots_iterator(xcb_get_setup(c));
    while (screen-- > 0 && roots.rem > 1)
        xcb_screen_next(&roots);

    std::vector<xcb_intern_atom_cookie_t> cookies;
    for (const char* name : names)
        cookies.push_back(xcb_intern_atom(c, 0, static_cast<std::uint16_t>(std::strlen(name)), name));
    for (const auto cookie : cookies) {
        const XcbReply<xcb_intern_atom_reply_t> reply(xcb_intern_atom_reply(c, cookie, nullptr));
        if (!reply) return;
        m_atoms.push_back(reply->atom);
    }
    m_root = roots.data->root;
}

std::vector<EwmhDisplay::Numbers> EwmhDisplay::numbers(std::span<const xcb_window_t> windows,
                                                       Name property) const {
    auto* c = m_connection.get();
    std::vector<xcb_get_property_cookie_t> cookies;
    for (const auto window : windows)
        cookies.push_back(
            xcb_get_property(c, 0, window, atom(property), XCB_GET_PROPERTY_TYPE_ANY, 0, longestProperty));
    std::vector<Numbers> all;
    for (const auto cookie : cookies) {
        const XcbReply<xcb_get_property_reply_t> reply(xcb_get_property_reply(c, cookie, nullptr));
        auto& numbers = all.emplace_back();
        if (!reply || reply->format != 32) continue;
        const auto* first = static_cast<const std::uint32_t*>(xcb_get_property_value(reply.get()));
        numbers.assign(first, first + reply->value_len);
    }
    return all;
}

EwmhDisplay::Numbers EwmhDisplay::numbersOfRoot(Name property) const {
    return numbers({&m_root, 1}, property).front();
}

EwmhDisplay::Numbers EwmhDisplay::processes(std::span<const xcb_window_t> windows) const {
    auto processes = processesByConnection(windows);
    const auto told = numbers(windows, windowProcess);
    for (std::size_t i = 0; i < windows.size(); ++i)
        if (processes[i] == 0 && !told[i].empty()) processes[i] = told[i].front();
    return processes;
}

EwmhDisplay::Numbers EwmhDisplay::processesByConnection(std::span<const xcb_window_t> windows) const {
    auto* c = m_connection.get();
    Numbers processes(windows.size());
    const auto* extension = xcb_get_extension_data(c, &xcb_res_id);
    if (!extension || !extension->present) return processes;
    std::vector<std::pair<xcb_get_geometry_cookie_t, xcb_res_query_client_ids_cookie_t>> cookies;
    for (const auto window : windows) {
        const xcb_res_client_id_spec_t question{window, XCB_RES_CLIENT_ID_MASK_LOCAL_CLIENT_PID};
        cookies.emplace_back(xcb_get_geometry(c, window), xcb_res_query_client_ids(c, 1, &question));
    }
    for (std::size_t i = 0; i < windows.size(); ++i) {
        const XcbReply<xcb_get_geometry_reply_t> geometry(
            xcb_get_geometry_reply(c, cookies[i].first, nullptr));
        const XcbReply<xcb_res_query_client_ids_reply_t> reply(
            xcb_res_query_client_ids_reply(c, cookies[i].second, nullptr));
        // The window may have gone, and its number be of the next one to connect: often of this connection.
        if (!geometry || !reply) continue;
        const auto ids = xcb_res_query_client_ids_ids_iterator(reply.get());
        if (ids.rem > 0 && xcb_res_client_id_value_value_length(ids.data) > 0)
            processes[i] = *xcb_res_client_id_value_value(ids.data);
    }
    return processes;
}

void EwmhDisplay::request(xcb_window_t window, Name message, std::uint32_t detail) const {
    constexpr std::uint32_t sourcePager = 2; // an "application" may be refused
    XcbSendToRoot(m_connection.get(), window, names[message], {sourcePager, XCB_CURRENT_TIME, detail, 0, 0});
}

void EwmhDisplay::raise(std::span<const xcb_window_t> windows) const {
    const std::uint32_t above = XCB_STACK_MODE_ABOVE;
    const auto known = numbersOfRoot(supported);
    const bool isKnown = std::ranges::find(known, atom(restackWindow)) != known.end();
    for (const auto window : windows)
        if (isKnown)
            request(window, restackWindow, above);
        else // it gets to hear of this as of a wish of the window's own
            xcb_configure_window(m_connection.get(), window, XCB_CONFIG_WINDOW_STACK_MODE, &above);
}

void EwmhDisplay::finish() const {
    auto* c = m_connection.get();
    const XcbReply<xcb_get_input_focus_reply_t> reply(
        xcb_get_input_focus_reply(c, xcb_get_input_focus(c), nullptr));
}

} // namespace platform
