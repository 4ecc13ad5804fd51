#pragma once

#include <QImage>

namespace platform {

/// What the X server shows in an area of its root window, in the display's own pixels, passed through memory
/// that both share: one round trip, and no copy through the socket. Null where the server cannot do that.
/// Transparency means nothing.
QImage XcbCapture(const QRect& area);

} // namespace platform
