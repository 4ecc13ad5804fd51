#pragma once

#include <array>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <xcb/xcb.h>

/// The toolkit's own connection to the X server, and the calls on it that several files need.
namespace platform {

struct XcbFreed {
    void operator()(void* memory) const {
        std::free(memory);
    } // NOLINT(*-no-malloc): xcb's replies ask for it
};
template <typename T>
using XcbReply = std::unique_ptr<T, XcbFreed>;

/// Null when the display is no X server.
xcb_connection_t* XcbConnection();
xcb_window_t XcbRootWindow(xcb_connection_t* connection);
xcb_atom_t XcbAtom(xcb_connection_t* connection, const char* name);
/// The window that the property of the root window names; 0 for none.
xcb_window_t XcbWindowNamedByRoot(const char* property);
/// Sends what a window manager listens for, about `window`.
void XcbSendToRoot(xcb_connection_t* connection, xcb_window_t window, const char* type,
                   const std::array<std::uint32_t, 5>& data);

} // namespace platform
