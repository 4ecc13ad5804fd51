#pragma once

#include <array>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <optional>
#include <xcb/xcb.h>

/// The calls to an X server that several files need.
namespace platform {

struct XcbFreed {
    void operator()(void* reply) const {
        std::free(reply); // NOLINT(*-no-malloc): as xcb asks for
    }
};
template <typename T>
using XcbReply = std::unique_ptr<T, XcbFreed>;

xcb_window_t XcbRootWindow(xcb_connection_t* connection);
/// Kept for the life of the process: connections must be to one server.
xcb_atom_t XcbAtom(xcb_connection_t* connection, const char* name);
xcb_window_t XcbSelectionOwner(xcb_connection_t* connection, const char* selection);
/// The first number of a property; nothing when the window has none.
std::optional<std::uint32_t> XcbNumber(xcb_connection_t* connection, xcb_window_t window,
                                       const char* property);

/// Sends `to` a message about `window`. With a mask it goes to those who selected for such events there.
void XcbSend(xcb_connection_t* connection, xcb_window_t to, std::uint32_t mask, xcb_window_t window,
             const char* type, const std::array<std::uint32_t, 5>& data);
/// Sends what a window manager listens for, about `window`.
void XcbSendToRoot(xcb_connection_t* connection, xcb_window_t window, const char* type,
                   const std::array<std::uint32_t, 5>& data);

} // namespace platform
