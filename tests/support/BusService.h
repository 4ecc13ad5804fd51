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
        const char* bus = "org.freedesktop.DBus";
        g_variant_unref(g_dbus_connection_call_sync(m_bus.get(), bus, "/org/freedesktop/DBus", bus,
                                                    "RequestName", g_variant_new("(su)", name, 0u), nullptr,
                                                    G_DBUS_CALL_FLAGS_NONE, -1, nullptr, nullptr));
        m_thread = std::jthread([this](const std::stop_token& stop) {
            while (!stop.stop_requested())
                g_main_context_iteration(m_context, TRUE);
        });
    }
    ~BusService() {
        m_thread.request_stop();
        g_main_context_wakeup(m_context);
        m_thread.join();
        g_dbus_connection_close_sync(m_bus.get(), nullptr, nullptr);
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

    GDBusNodeInfo* m_node;
    GMainContext* m_context = g_main_context_new();
    platform::GObjectPointer<GDBusConnection> m_bus;
    std::jthread m_thread;
    std::mutex m_mutex;
    std::vector<std::string> m_calls;
};
