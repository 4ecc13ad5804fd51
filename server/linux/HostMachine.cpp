#include "server/linux/HostMachine.h"

#include "lib/plist/Value.h"
#include "platform/LaunchServices.h"
#include "platform/MainLoop.h"
#include "platform/Status.h"
#include "platform/linux/GObjectPointer.h"
#include "server/catalogues/Catalogue.h"
#include "server/catalogues/Machine.h"
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

using platform::GObjectPointer;
using platform::StringOr;

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
    platform::LaunchRequest request;
    request.flags = platform::launchAsync;
    if (item.id.starts_with(placePrefix)) {
        request.documentURLs = {item.id.substr(placePrefix.size())};
    } else {
        const GObjectPointer<GDesktopAppInfo> entry(g_desktop_app_info_new(item.id.c_str()));
        if (!entry) return done("its desktop entry is gone");
        request.applicationPath = StringOr(g_desktop_app_info_get_filename(entry.get()));
    }
    const std::weak_ptr<const bool> life = m_life;
    m_launching.open(request, [life, done = std::move(done)](const platform::LaunchOutcome& outcome) {
        if (life.expired()) return;
        done(outcome.status == platform::status::success ? std::nullopt : std::optional(outcome.reason));
    });
}

std::unique_ptr<platform::Handle> HostMachine::watch(std::function<void()> changed) {
    return std::make_unique<Monitor>(std::move(changed));
}

} // namespace tessel
