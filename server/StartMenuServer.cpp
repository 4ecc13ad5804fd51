#include "server/StartMenuServer.h"

#include "lib/base/KXNotificationCenter.h"
#include "lib/base/Log.h"
#include "lib/ipc/KXIPCMessage.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCObserverEntry.h"
#include "lib/ipc/KXIPCServer.h"
#include "lib/plist/Value.h"
#include "server/Record.h"
#include "server/Worker.h"
#include "server/catalogues/Catalogue.h"
#include "server/catalogues/CatalogueKeeper.h"
#include "server/catalogues/Machine.h"
#include "server/catalogues/MenuBuilder.h"

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace tessel {
namespace {

constexpr const char* menuUpdate = "menu.update";
constexpr const char* menuShow = "menu.show";
constexpr const char* menuRefresh = "menu.refresh";
constexpr const char* menuOnAction = "menu.onAction";
constexpr const char* menuSettings = "menu.settings";
constexpr const char* menuSelectIndex = "menu.selectIndex";

} // namespace

StartMenuServer::StartMenuServer(KXIPCServer& server, std::vector<std::unique_ptr<Machine>>& machines,
                                 const Executor& execute, Record& record, const Options& options)
    : m_server(server)
    , m_record(record)
    , m_selected(std::min(options.selected, machines.size() - 1))
    , m_showWhenConnected(options.showWhenConnected)
    , m_entries(entries()) {
    for (const auto& machine : machines) {
        const std::size_t index = m_machines.size();
        m_machines.push_back({.keeper = std::make_unique<CatalogueKeeper>(
                                  *machine, execute, [this, index] { onChanged(index); }),
                              .launches = {},
                              .menu = {}});
    }
    m_server.addEntries(m_entries, this);
    m_machines[m_selected].keeper->refresh();
    for (const Shown& shown : m_machines)
        shown.keeper->refresh();
}

StartMenuServer::~StartMenuServer() {
    m_server.removeEntries(m_entries, this);
}

KXIPCObserverEntry::Array StartMenuServer::entries() {
    const auto received = [this](void (StartMenuServer::*handler)(const KXIPCMessage&)) {
        return [this, handler](const KXNotification& notification) {
            const KXIPCMessage message(notification.name, std::nullopt, KXUserInfo(notification));
            m_record.add("received", message);
            (this->*handler)(message);
        };
    };
    const KXIPCObserverEntryRow rows[] = {
        {KX_IPC_ADD_LISTENER_NOTIFICATION,
         [this](const auto& notification) { onAddListener(notification); },
         {}},
        {menuRefresh, received(&StartMenuServer::onRefresh), {}},
        {menuOnAction, received(&StartMenuServer::onAction), {}},
        {menuSelectIndex, received(&StartMenuServer::onSelectIndex), {}},
        {menuSettings, received(&StartMenuServer::onSettings), {}},
    };
    return KXIPCObserverEntryArray(rows, std::size(rows));
}

/// The server itself was told first, so the client is among its own by now.
void StartMenuServer::onAddListener(const KXNotification& notification) {
    const auto added = KXIPCObserverEntry::observerEntryTableFromNotification(notification);
    if (!added) return;
    // An agent that has come has nothing to show at the first click unless it gets the menu now. One that was
    // there before us keeps what it shows until there is something to replace it with.
    const bool wantsUpdates =
        !KXIPCMessage(menuUpdate, std::nullopt, nullptr).matchesInObserverArray(*added).empty();
    if (wantsUpdates && m_machines[m_selected].keeper->isRead()) postUpdate();
    const KXIPCMessage show(menuShow, std::nullopt, nullptr);
    if (m_showWhenConnected && !m_server.clientsForMessage(show).empty()) {
        m_showWhenConnected = false;
        post(show);
    }
}

void StartMenuServer::onRefresh(const KXIPCMessage&) {
    postUpdate();
    m_machines[m_selected].keeper->refresh();
}

void StartMenuServer::onSelectIndex(const KXIPCMessage& message) {
    const auto index = message.userInfo()["selectedIndex"].longLongValue();
    if (index < 0 || static_cast<std::size_t>(index) >= m_machines.size()) {
        Log("Start menu: there is no machine %lld\n", static_cast<long long>(index));
        return;
    }
    m_selected = static_cast<std::size_t>(index);
    onRefresh(message);
}

void StartMenuServer::onSettings(const KXIPCMessage&) {
    Log("Start menu: there are no settings to show yet\n");
}

void StartMenuServer::onAction(const KXIPCMessage& message) {
    const plist::Value& action = message.userInfo();
    const Token token = ParseToken(action["representedObject"].stringOr(""));
    const auto shown = std::ranges::find(m_machines, token.machine,
                                         [](const Shown& one) { return one.keeper->machine().id(); });
    std::string refusal = "no such machine";
    const CatalogueItem* item = nullptr;
    if (shown != m_machines.end())
        item = FindItemForAction(shown->keeper->index(), token.item, action, refusal);
    if (item)
        launch(static_cast<std::size_t>(shown - m_machines.begin()), *item);
    else
        Log("Start menu: refused to act on %s: %s\n", DigestLine("received", message).c_str(),
            refusal.c_str());
}

void StartMenuServer::launch(std::size_t index, const CatalogueItem& item) {
    const auto done = [this, alive = std::weak_ptr(m_alive), index, id = item.id,
                       kind = item.kind](const std::optional<std::string>& failure) {
        if (!alive.expired()) onLaunched(index, kind, id, failure);
    };
    m_machines[index].keeper->machine().launch(item, done);
}

void StartMenuServer::onLaunched(std::size_t index, ItemKind kind, const std::string& id,
                                 const std::optional<std::string>& failure) {
    Shown& shown = m_machines[index];
    plist::Dictionary details{{"representedObject", TokenText(shown.keeper->machine().id(), id)}};
    if (failure) {
        details.set("reason", *failure);
        Log("Start menu: could not launch \"%s\": %s\n", id.c_str(), failure->c_str());
    }
    m_record.add(failure ? "failed" : "performed", KXIPCMessage(ActionName(kind), std::nullopt, details));
    if (failure || kind != ItemKind::application) return;
    ++shown.launches[id];
    onChanged(index);
}

void StartMenuServer::onChanged(std::size_t index) {
    m_machines[index].menu = nullptr;
    if (index == m_selected) postUpdate();
}

void StartMenuServer::postUpdate() {
    Shown& shown = m_machines[m_selected];
    const CatalogueKeeper& keeper = *shown.keeper;
    if (m_server.clientsForMessage({menuUpdate, std::nullopt, nullptr}).empty()) return;
    if (shown.menu.isNil())
        shown.menu = BuildMenu({keeper.machine().id(), keeper.catalogue(), keeper.icons(), shown.launches});
    plist::Array names;
    for (const Shown& one : m_machines)
        names.push_back(one.keeper->machine().name());
    post({menuUpdate, std::nullopt,
          plist::Dictionary{
              {"menu", shown.menu}, {"nameList", std::move(names)}, {"selectedIndex", m_selected}}});
}

void StartMenuServer::post(const KXIPCMessage& message) {
    m_server.postMessage(message, false);
    m_record.add("sent", message);
}

} // namespace tessel
