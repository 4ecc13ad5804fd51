#pragma once

#include "platform/linux/XcbCalls.h"

#include <xcb/xcb.h>

namespace platform {

/// The toolkit's own connection to the X server. Null when the display is no X server.
xcb_connection_t* XcbConnection();
/// The window that the property of the root window names; 0 for none.
xcb_window_t XcbWindowNamedByRoot(const char* property);

} // namespace platform
