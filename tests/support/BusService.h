#pragma once

#include "platform/linux/MessageBus.h"

#include <atomic>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

/// Somebody on the session bus, on a thread of its own: answers every call of its one interface with nothing,
/// and has one boolean for every property.
class BusService {
public:
    BusService(const char* name, const char* path, const char* interfaceXML)
        : m_node(g_dbus_node_info_new_for_xml(interfaceXML, nullptr)) {
        g_main_context_push_thread_default(m_context);
        m_bus = platform::ConnectToBus(G_BUS_TYPE_SESSION, nullptr);
        static const GDBusInterfaceVTable answers = {
            [](auto*, auto*, auto*, auto*, auto*, auto*, auto* call, auto* self) {
                static_cast<BusService*>(self)->answer(call);
            },
            [](auto*, auto*, auto*, auto*, auto*, auto*, auto* self) {
                return g_variant_new_boolean(static_cast<BusService*>(self)->property);
            },
            nullptr,
            {}};
        g_dbus_connection_register_object(m_bus.get(), path, m_node->interfaces[0], &answers, this, nullptr,
                                          nullptr);
        g_main_context_pop_thread_default(m_context);
        auto* reply = g_dbus_connection_call_sync(m_bus.get(), "org.freedesktop.DBus",
                                                  "/org/freedesktop/DBus", "org.freedesktop.DBus",
                                                  "RequestName", g_variant_new("(su)", name, 0u), nullptr,
                                                  G_DBUS_CALL_FLAGS_NONE, -1, nullptr, nullptr);
        g_variant_unref(reply);
        m_thread = std::thread([this] { g_main_loop_run(m_loop); });
    }
    ~BusService() {
        g_main_context_invoke(m_context, onQuit, m_loop);
        m_thread.join();
        g_dbus_connection_close_sync(m_bus.get(), nullptr, nullptr);
        g_main_loop_unref(m_loop);
        g_main_context_unref(m_context);
        g_dbus_node_info_unref(m_node);
    }
    BusService(const BusService&) = delete;
    BusService& operator=(const BusService&) = delete;

    std::atomic<bool> property = false;
    /// "Method(arguments)" of each, in order.
    std::vector<std::string> calls() {
        const std::lock_guard lock(m_mutex);
        return m_calls;
    }

private:
    /// "Method(arguments)" of the call, which is answered with nothing.
    void answer(GDBusMethodInvocation* call) {
        {
            const std::lock_guard lock(m_mutex);
            m_calls.push_back(
                g_dbus_method_invocation_get_method_name(call) +
                platform::TakeString(g_variant_print(g_dbus_method_invocation_get_parameters(call), FALSE)));
        }
        g_dbus_method_invocation_return_value(call, nullptr);
    }
    static gboolean onQuit(gpointer loop) {
        g_main_loop_quit(static_cast<GMainLoop*>(loop));
        return G_SOURCE_REMOVE;
    }

    GDBusNodeInfo* m_node;
    GMainContext* m_context = g_main_context_new();
    GMainLoop* m_loop = g_main_loop_new(m_context, FALSE);
    platform::GObjectPointer<GDBusConnection> m_bus;
    std::thread m_thread;
    std::mutex m_mutex;
    std::vector<std::string> m_calls;
};
