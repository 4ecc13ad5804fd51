#pragma once

#include "platform/linux/GObjectPointer.h"

#include <gio/gio.h>
#include <string>

namespace platform {

/// A connection of our own to a bus. The one that the library shares would end the process with the bus.
/// Null, and why in `error`, when there is none.
GObjectPointer<GDBusConnection> ConnectToBus(const std::string& address, GError** error);
GObjectPointer<GDBusConnection> ConnectToBus(GBusType bus, GError** error);

} // namespace platform
