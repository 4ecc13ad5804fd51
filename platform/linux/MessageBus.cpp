#include "platform/linux/MessageBus.h"

#include "platform/linux/GObjectPointer.h"

#include <gio/gio.h>
#include <glib.h>
#include <string>

namespace platform {

GObjectPointer<GDBusConnection> ConnectToBus(const std::string& address, GError** error) {
    const auto flags = static_cast<GDBusConnectionFlags>(G_DBUS_CONNECTION_FLAGS_AUTHENTICATION_CLIENT |
                                                         G_DBUS_CONNECTION_FLAGS_MESSAGE_BUS_CONNECTION);
    return GObjectPointer<GDBusConnection>(
        g_dbus_connection_new_for_address_sync(address.c_str(), flags, nullptr, nullptr, error));
}

GObjectPointer<GDBusConnection> ConnectToBus(GBusType bus, GError** error) {
    const std::string address = TakeString(g_dbus_address_get_for_bus_sync(bus, nullptr, error));
    return address.empty() ? nullptr : ConnectToBus(address, error);
}

} // namespace platform
