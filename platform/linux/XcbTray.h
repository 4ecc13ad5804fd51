#pragma once

#include "lib/base/Geometry.h"

#include <QImage>
#include <cstdint>
#include <optional>

/// The system tray of an X11 desktop, as far as the toolkit does not know it. Windows are native ids, 0 is
/// none. Everything answers empty without an X server.
namespace platform {

/// The window of the tray. From now on the events below tell of its end, and of new trays.
std::uint32_t XcbFindTray();
/// Whether the tray wants windows with an alpha channel.
bool XcbTrayIsTranslucent(std::uint32_t tray);
/// Asks the tray to take the window in. The window must not have been shown: a window manager would grab it.
void XcbDockInTray(std::uint32_t tray, std::uint32_t window);
/// Whether the window was taken in by a bridge to another kind of bar, which keeps it out of sight.
bool XcbIsHiddenByBridge(std::uint32_t window);

/// In native pixels, y downwards from the top of the desktop. The toolkit's own answer is stale once the tray
/// was laid out anew.
KXRect XcbFrameOnDesktop(std::uint32_t window);
/// What the tray shows behind a window without alpha channel; null when that cannot be had.
QImage XcbTrayBackground(std::uint32_t window);

struct XcbTrayEvent {
    enum class Kind { newTray, destroyed, movedOut, takenIn };
    Kind kind;
    std::uint32_t window; ///< of which this is said
};
std::optional<XcbTrayEvent> XcbReadTrayEvent(const void* nativeEvent);

} // namespace platform
