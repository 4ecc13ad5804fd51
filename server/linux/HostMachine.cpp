#include "server/linux/HostMachine.h"

#include "lib/plist/Value.h"
#include "platform/MainLoop.h"
#include "server/catalogues/Catalogue.h"
#include "server/catalogues/Machine.h"
#include "server/linux/GObjectPointer.h"
#include "server/linux/HostCatalogue.h"
#include "server/linux/HostIconTheme.h"

#include <functional>
#include <gio/gdesktopappinfo.h>
#include <gio/gio.h>
#include <glib.h>
#include <memory>
#include <optional>
#include <string>
#include <utility>

namespace tessel {
namespace {

using Handler = Machine::LaunchHandler;

void Finish(gpointer handler, bool succeeded, GError* error) {
    const std::unique_ptr<Handler> done(static_cast<Handler*>(handler));
    const GErrorPointer owned(error);
    if (succeeded)
        (*done)(std::nullopt);
    else
        (*done)(error ? error->message : "unknown reason");
}

void OnEntryLaunched(GObject* entry, GAsyncResult* result, gpointer handler) {
    GError* error = nullptr;
    const bool succeeded = g_app_info_launch_uris_finish(G_APP_INFO(entry), result, &error);
    Finish(handler, succeeded, error);
}

void OnPlaceOpened(GObject*, GAsyncResult* result, gpointer handler) {
    GError* error = nullptr;
    const bool succeeded = g_app_info_launch_default_for_uri_finish(result, &error);
    Finish(handler, succeeded, error);
}

class Monitor final : public platform::Handle {
public:
    explicit Monitor(std::function<void()> changed)
        : m_changed(std::move(changed))
        , m_monitor(g_app_info_monitor_get())
        , m_connection(g_signal_connect_swapped(m_monitor.get(), "changed", G_CALLBACK(onChanged), this)) {}
    ~Monitor() override { g_signal_handler_disconnect(m_monitor.get(), m_connection); }
    Monitor(const Monitor&) = delete;
    Monitor& operator=(const Monitor&) = delete;

private:
    static void onChanged(Monitor* self) { self->m_changed(); }

    std::function<void()> m_changed;
    GObjectPointer<GAppInfoMonitor> m_monitor;
    gulong m_connection;
};

} // namespace

std::optional<Catalogue> HostMachine::readCatalogue() {
    m_icons.look(HostIconPlaces());
    return ReadHostCatalogue();
}

plist::Value HostMachine::readIcon(const std::string& icon) {
    return m_icons.read(icon);
}

void HostMachine::launch(const CatalogueItem& item, LaunchHandler done) {
    const GObjectPointer<GAppLaunchContext> context(g_app_launch_context_new());
    auto handler = std::make_unique<Handler>(std::move(done));
    if (item.id.starts_with(placePrefix)) {
        const std::string uri = item.id.substr(placePrefix.size());
        g_app_info_launch_default_for_uri_async(uri.c_str(), context.get(), nullptr, OnPlaceOpened,
                                                handler.release());
        return;
    }
    const GObjectPointer<GDesktopAppInfo> entry(g_desktop_app_info_new(item.id.c_str()));
    if (!entry) return (*handler)("its desktop entry is gone");
    g_app_info_launch_uris_async(G_APP_INFO(entry.get()), nullptr, context.get(), nullptr, OnEntryLaunched,
                                 handler.release());
}

std::unique_ptr<platform::Handle> HostMachine::watch(std::function<void()> changed) {
    return std::make_unique<Monitor>(std::move(changed));
}

} // namespace tessel
