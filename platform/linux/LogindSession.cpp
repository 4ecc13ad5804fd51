#include "platform/linux/LogindSession.h"

#include "platform/linux/GObjectPointer.h"
#include "platform/linux/MessageBus.h"

#include <gio/gio.h>
#include <glib.h>
#include <memory>
#include <optional>

namespace platform {

namespace {

constexpr int patience = 1000; ///< in milliseconds

} // namespace

std::optional<bool> LogindSession::isActive() const {
    const auto bus =
        m_busAddress.empty() ? ConnectToBus(G_BUS_TYPE_SYSTEM, nullptr) : ConnectToBus(m_busAddress, nullptr);
    if (!bus) return {};
    const std::unique_ptr<GVariant, GVariantUnref> answer(g_dbus_connection_call_sync(
        bus.get(), "org.freedesktop.login1", "/org/freedesktop/login1/session/auto",
        "org.freedesktop.DBus.Properties", "Get",
        g_variant_new("(ss)", "org.freedesktop.login1.Session", "Active"), G_VARIANT_TYPE("(v)"),
        G_DBUS_CALL_FLAGS_NONE, patience, nullptr, nullptr));
    if (!answer) return {};
    GVariant* value = nullptr;
    g_variant_get(answer.get(), "(v)", &value);
    const std::unique_ptr<GVariant, GVariantUnref> active(value);
    if (!g_variant_is_of_type(active.get(), G_VARIANT_TYPE_BOOLEAN)) return {};
    return g_variant_get_boolean(active.get()) != FALSE;
}

} // namespace platform
