#include "server/linux/BusLoss.h"

#include <gio/gio.h>

namespace tessel {

void SurviveBusLoss() {
    // Switching exit-on-close off looks simpler, and has to be done for each connection anew, in time.
    g_type_class_ref(G_TYPE_DBUS_CONNECTION); // makes the signal, and is kept
    g_signal_override_class_handler("closed", G_TYPE_DBUS_CONNECTION,
                                    G_CALLBACK(+[](GDBusConnection*, gboolean, GError*) {}));
}

} // namespace tessel
