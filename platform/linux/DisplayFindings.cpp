#include "platform/linux/DisplayFindings.h"

#include "platform/Findings.h"
#include "platform/linux/NotifierHost.h"
#include "platform/linux/XcbCalls.h"
#include "platform/linux/XcbConnection.h"
#include "platform/linux/XcbPanel.h"
#include "platform/linux/XcbTray.h"

#include <QDBusConnection>
#include <QDBusInterface>
#include <QGuiApplication>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <xcb/xcb.h>
#include <xcb/xproto.h>

namespace platform {

namespace {

std::string environment(const char* name) {
    return qEnvironmentVariable(name).toStdString();
}

std::string text(xcb_connection_t* c, xcb_window_t window, const char* property) {
    constexpr std::uint32_t longest = 64; // in words
    const auto cookie = xcb_get_property(c, 0, window, XcbAtom(c, property), XCB_ATOM_ANY, 0, longest);
    const XcbReply<xcb_get_property_reply_t> reply(xcb_get_property_reply(c, cookie, nullptr));
    if (!reply) return {};
    return {static_cast<const char*>(xcb_get_property_value(reply.get())),
            static_cast<std::size_t>(xcb_get_property_value_length(reply.get()))};
}

std::string windowManagerName() {
    const auto window = XcbWindowNamedByRoot("_NET_SUPPORTING_WM_CHECK");
    return window == XCB_WINDOW_NONE ? std::string() : text(XcbConnection(), window, "_NET_WM_NAME");
}

bool hasNotifierHost() {
    QDBusInterface watcher(NotifierHost::serviceName(), NotifierHost::path(), NotifierHost::serviceName());
    return watcher.property("IsStatusNotifierHostRegistered").toBool();
}

} // namespace

bool DisplayAnswers() {
    const std::unique_ptr<xcb_connection_t, decltype(&xcb_disconnect)> c(xcb_connect(nullptr, nullptr),
                                                                         xcb_disconnect);
    return xcb_connection_has_error(c.get()) == 0;
}

DisplayFindings LookAtDisplay() {
    DisplayFindings findings;
    findings.name = environment("DISPLAY");
    findings.sessionType = environment("XDG_SESSION_TYPE");
    findings.desktop = environment("XDG_CURRENT_DESKTOP");
    findings.isUnderWayland = qEnvironmentVariableIsSet("WAYLAND_DISPLAY");
    const auto bus = QDBusConnection::sessionBus();
    if (!bus.isConnected()) findings.busFault = bus.lastError().message().toStdString();
    if (bus.isConnected()) findings.hasNotifierHost = hasNotifierHost();
    if (!qGuiApp || !XcbConnection()) return findings;
    findings.answers = true;
    findings.isUnderWayland = XcbIsUnderWayland();
    findings.windowManager = windowManagerName();
    findings.hasTray = XcbFindTray() != 0;
    findings.isCompositing = XcbIsCompositing();
    findings.blursBehind = XcbAnnouncesBlurBehind();
    return findings;
}

} // namespace platform
