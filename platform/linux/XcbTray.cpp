#include "platform/linux/XcbTray.h"

#include "lib/base/Geometry.h"
#include "platform/linux/XcbCalls.h"
#include "platform/linux/XcbConnection.h"

#include <cstdint>
#include <optional>
#include <xcb/xcb.h>
#include <xcb/xproto.h>

namespace platform {

namespace {

constexpr const char* traySelection = "_NET_SYSTEM_TRAY_S0";
constexpr std::uint32_t requestDock = 0;

void watchStructure(xcb_connection_t* c, xcb_window_t window) {
    const XcbReply<xcb_get_window_attributes_reply_t> reply(
        xcb_get_window_attributes_reply(c, xcb_get_window_attributes(c, window), nullptr));
    if (!reply) return;
    const std::uint32_t mask = reply->your_event_mask | XCB_EVENT_MASK_STRUCTURE_NOTIFY;
    xcb_change_window_attributes(c, window, XCB_CW_EVENT_MASK, &mask);
}

int depthOfVisual(xcb_connection_t* c, xcb_visualid_t visual) {
    const auto* screen = xcb_setup_roots_iterator(xcb_get_setup(c)).data;
    for (auto depth = xcb_screen_allowed_depths_iterator(screen); depth.rem > 0; xcb_depth_next(&depth))
        for (int i = 0; i < xcb_depth_visuals_length(depth.data); ++i)
            if (xcb_depth_visuals(depth.data)[i].visual_id == visual) return depth.data->depth;
    return 0;
}

} // namespace

std::uint32_t XcbFindTray() {
    auto* c = XcbConnection();
    if (!c) return 0;
    watchStructure(c, XcbRootWindow(c));
    const auto tray = XcbSelectionOwner(c, traySelection);
    if (tray != XCB_WINDOW_NONE) watchStructure(c, tray);
    return tray;
}

bool XcbTrayIsTranslucent(std::uint32_t tray) {
    auto* c = XcbConnection();
    if (!c) return false;
    const auto visual = XcbNumber(c, tray, "_NET_SYSTEM_TRAY_VISUAL");
    return visual && depthOfVisual(c, *visual) == 32;
}

void XcbDockInTray(std::uint32_t tray, std::uint32_t window) {
    auto* c = XcbConnection();
    if (!c) return;
    watchStructure(c, window);
    XcbSend(c, tray, XCB_EVENT_MASK_NO_EVENT, tray, "_NET_SYSTEM_TRAY_OPCODE",
            {XCB_CURRENT_TIME, requestDock, window, 0, 0});
    xcb_flush(c);
}

bool XcbIsHiddenByBridge(std::uint32_t window) {
    auto* c = XcbConnection();
    if (!c) return false;
    const XcbReply<xcb_query_tree_reply_t> tree(xcb_query_tree_reply(c, xcb_query_tree(c, window), nullptr));
    return tree && XcbNumber(c, tree->parent, "_NET_WM_WINDOW_OPACITY") == 0U;
}

KXRect XcbFrameOnDesktop(std::uint32_t window) {
    auto* c = XcbConnection();
    if (!c) return {};
    const auto placeCookie = xcb_translate_coordinates(c, window, XcbRootWindow(c), 0, 0);
    const auto sizeCookie = xcb_get_geometry(c, window);
    const XcbReply<xcb_translate_coordinates_reply_t> place(
        xcb_translate_coordinates_reply(c, placeCookie, nullptr));
    const XcbReply<xcb_get_geometry_reply_t> size(xcb_get_geometry_reply(c, sizeCookie, nullptr));
    if (!place || !size) return {};
    return {static_cast<float>(place->dst_x), static_cast<float>(place->dst_y),
            static_cast<float>(size->width), static_cast<float>(size->height)};
}

QImage XcbTrayBackground(std::uint32_t window) {
    auto* c = XcbConnection();
    if (!c) return {};
    const std::uint32_t parentRelative = XCB_BACK_PIXMAP_PARENT_RELATIVE;
    xcb_change_window_attributes(c, window, XCB_CW_BACK_PIXMAP, &parentRelative);
    const XcbReply<xcb_get_geometry_reply_t> size(
        xcb_get_geometry_reply(c, xcb_get_geometry(c, window), nullptr));
    if (!size) return {};
    xcb_clear_area(c, 0, window, 0, 0, size->width, size->height);
    const auto cookie =
        xcb_get_image(c, XCB_IMAGE_FORMAT_Z_PIXMAP, window, 0, 0, size->width, size->height, ~0U);
    const XcbReply<xcb_get_image_reply_t> image(xcb_get_image_reply(c, cookie, nullptr));
    constexpr int bytesPerPixel = 4;
    if (!image || xcb_get_image_data_length(image.get()) != size->width * size->height * bytesPerPixel)
        return {};
    return QImage(xcb_get_image_data(image.get()), size->width, size->height, QImage::Format_RGB32).copy();
}

std::optional<XcbTrayEvent> XcbReadTrayEvent(const void* nativeEvent) {
    using Kind = XcbTrayEvent::Kind;
    auto* c = XcbConnection();
    switch (static_cast<const xcb_generic_event_t*>(nativeEvent)->response_type & 0x7F) {
    case XCB_CLIENT_MESSAGE: {
        const auto* event = static_cast<const xcb_client_message_event_t*>(nativeEvent);
        if (event->type != XcbAtom(c, "MANAGER") || event->data.data32[1] != XcbAtom(c, traySelection))
            return {};
        return XcbTrayEvent{Kind::newTray, event->data.data32[2]};
    }
    case XCB_DESTROY_NOTIFY:
        return XcbTrayEvent{Kind::destroyed,
                            static_cast<const xcb_destroy_notify_event_t*>(nativeEvent)->window};
    case XCB_REPARENT_NOTIFY: {
        const auto* event = static_cast<const xcb_reparent_notify_event_t*>(nativeEvent);
        return XcbTrayEvent{event->parent == XcbRootWindow(c) ? Kind::movedOut : Kind::takenIn,
                            event->window};
    }
    default:
        return {};
    }
}

} // namespace platform
