#include "platform/linux/BusApplication.h"

#include "platform/linux/GObjectPointer.h"

#include <algorithm>
#include <functional>
#include <gio/gio.h>
#include <glib.h>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace platform {

namespace {

constexpr const char* interface = "org.freedesktop.Application";
constexpr int patience = 25'000; ///< in milliseconds; starting may take long

using Answer = std::function<void(const std::string&)>;

/// "/org/example/My_App" of "org.example.My-App".
std::string ObjectPathOf(const std::string& name) {
    std::string path = "/" + name;
    std::ranges::replace(path, '.', '/');
    std::ranges::replace(path, '-', '_');
    return path;
}

struct Call {
    explicit Call(const std::string& applicationName, const std::vector<std::string>& documentURLs)
        : name(applicationName)
        , path(ObjectPathOf(applicationName))
        , method(documentURLs.empty() ? "Activate" : "Open") {
        GVariantBuilder urls, platformData;
        g_variant_builder_init(&urls, G_VARIANT_TYPE("as"));
        g_variant_builder_init(&platformData, G_VARIANT_TYPE("a{sv}"));
        for (const auto& url : documentURLs)
            g_variant_builder_add(&urls, "s", url.c_str());
        auto* known = g_variant_builder_end(&platformData);
        auto* documents = g_variant_ref_sink(g_variant_builder_end(&urls));
        arguments = documentURLs.empty() ? g_variant_new("(@a{sv})", known)
                                         : g_variant_new("(@as@a{sv})", documents, known);
        g_variant_unref(documents);
    }

    std::string name, path;
    const char* method;
    GVariant* arguments; ///< floating: whoever sends it takes it
};

/// Why a call failed; takes both.
std::string FailureOf(GVariant* answer, GError* error) {
    const std::unique_ptr<GVariant, GVariantUnref> ownedAnswer(answer);
    const GErrorPointer ownedError(error);
    if (answer != nullptr) return {};
    return error != nullptr ? error->message : "no reason was given";
}

void OnAnswer(GObject* bus, GAsyncResult* result, gpointer handler) {
    const std::unique_ptr<Answer> done(static_cast<Answer*>(handler));
    GError* error = nullptr;
    auto* answer = g_dbus_connection_call_finish(G_DBUS_CONNECTION(bus), result, &error);
    (*done)(FailureOf(answer, error));
}

} // namespace

std::string StartOverBusAndWait(GDBusConnection* bus, const std::string& name,
                                const std::vector<std::string>& documentURLs) {
    GError* error = nullptr;
    const Call call(name, documentURLs);
    auto* answer = g_dbus_connection_call_sync(bus, call.name.c_str(), call.path.c_str(), interface,
                                               call.method, call.arguments, nullptr, G_DBUS_CALL_FLAGS_NONE,
                                               patience, nullptr, &error);
    return FailureOf(answer, error);
}

void StartOverBus(GDBusConnection* bus, const std::string& name, const std::vector<std::string>& documentURLs,
                  Answer done) {
    const Call call(name, documentURLs);
    auto handler = std::make_unique<Answer>(std::move(done));
    g_dbus_connection_call(bus, call.name.c_str(), call.path.c_str(), interface, call.method, call.arguments,
                           nullptr, G_DBUS_CALL_FLAGS_NONE, patience, nullptr, OnAnswer, handler.release());
}

} // namespace platform
