#pragma once

#include "lib/ipc/KXIPCServer.h"
#include "server/Record.h"
#include "server/catalogues/CatalogueKeeper.h"
#include "server/catalogues/MenuBuilder.h"

#include <memory>
#include <vector>

namespace tessel {

/// The main application's side of the start menu: answers the agent with the machines' catalogues, and does
/// what it asks for. Main thread only.
class StartMenuServer {
public:
    struct Options {
        std::size_t selected = 0;       ///< the machine shown first
        bool showWhenConnected = false; ///< opens the menu of the first agent that comes
    };

    /// All but the machines must outlive it. There is at least one machine. Reading starts at once, with the
    /// machine that is shown.
    StartMenuServer(KXIPCServer& server, std::vector<std::unique_ptr<Machine>>& machines,
                    const Executor& execute, Record& record, const Options& options);
    ~StartMenuServer();
    StartMenuServer(const StartMenuServer&) = delete;
    StartMenuServer& operator=(const StartMenuServer&) = delete;

private:
    struct Shown {
        std::unique_ptr<CatalogueKeeper> keeper;
        LaunchCounts launches;
        plist::Value menu; ///< as built last; nil when it must be built again
    };

    KXIPCObserverEntry::Array entries();
    void onAddListener(const KXNotification& notification);
    void onRefresh(const KXIPCMessage& message);
    void onAction(const KXIPCMessage& message);
    void onSelectIndex(const KXIPCMessage& message);
    void onSettings(const KXIPCMessage& message);
    void launch(std::size_t index, const CatalogueItem& item);
    void onLaunched(std::size_t index, ItemKind kind, const std::string& id,
                    const std::optional<std::string>& failure);
    void onChanged(std::size_t index);
    void postUpdate();
    void post(const KXIPCMessage& message);

    KXIPCServer& m_server;
    Record& m_record;
    std::vector<Shown> m_machines;
    std::size_t m_selected;
    bool m_showWhenConnected;
    KXIPCObserverEntry::Array m_entries;
    std::shared_ptr<bool> m_alive = std::make_shared<bool>(true);
};

} // namespace tessel
