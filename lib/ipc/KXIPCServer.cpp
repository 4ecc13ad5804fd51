#include "lib/ipc/KXIPCServer.h"

#include "lib/base/KXNotificationCenter.h"
#include "lib/base/Log.h"
#include "lib/ipc/KXIPCCommon.h"
#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCMessage.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCObserverEntry.h"
#include "lib/ipc/KXIPCSend.h"
#include "lib/kxAppKit/system/KXProcess.h"
#include "lib/plist/Value.h"
#include "platform/DistributedNotificationCenter.h"
#include "platform/MessagePort.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <iterator>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace {

std::optional<std::uint64_t> clientNumber(const KXNotification& notification) {
    const auto number = KXUserInfo(notification)[KX_IPC_PARAM_PSN];
    if (number.type() != plist::Type::integer) return std::nullopt;
    return number.unsignedLongLongValue();
}

/// What the entries of a table take, counted no further than what a client may have.
std::size_t weigh(const plist::Value& table) {
    constexpr std::size_t ofEntry = 256;
    std::size_t weight = 0;
    for (std::size_t i = 0; i < table.size() && weight <= KXIPCServer::mostEntryBytes; ++i) {
        const auto row = table.at(i);
        weight += ofEntry + row["name"].stringOr("").size() + row["object"].stringOr("").size();
    }
    return weight;
}

} // namespace

KXIPCServer::KXIPCServer(KXIPCContext& context)
    : KXIPCCommon(context) {
    const KXIPCObserverEntryRow rows[] = {
        {KX_IPC_ADD_LISTENER_NOTIFICATION,
         [this](const auto& notification) { onAddListener(notification); },
         {}},
        {KX_IPC_REMOVE_LISTENER_NOTIFICATION,
         [this](const auto& notification) { onRemoveListener(notification); },
         {}},
    };
    KXIPCCommon::addEntries(KXIPCObserverEntryArray(rows, std::size(rows)), this);
}

KXIPCServer::~KXIPCServer() {
    removeAllClients();
}

std::string KXIPCServer::portName() const {
    return KX_IPC_ServerPortName();
}

void KXIPCServer::setAllowIncomingMessages(bool allow) {
    KXIPCCommon::setAllowIncomingMessages(allow);
    // Another has the name: its clients would be told that it had started anew.
    if (allow && !isReachable()) return;
    context().notifications.post(allowIncomingMessages() ? KX_IPC_SERVER_DID_LAUNCH_NOTIFICATION
                                                         : KX_IPC_SERVER_DID_TERMINATE_NOTIFICATION);
}

void KXIPCServer::postMessage(const KXIPCMessage& message, bool synchronously) {
    if (!dispatchMessageToLocalListeners(message)) return;
    for (const auto& client : clientsForMessage(message))
        KX_IPC_SendMessageToNamedPort(context(), message, KX_IPC_PortNameForProcess(client.get()),
                                      synchronously);
}

std::vector<KXProcess::Pointer> KXIPCServer::clientsForMessage(const KXIPCMessage& message) const {
    std::vector<KXProcess::Pointer> clients;
    for (const auto& [number, client] : m_clients)
        if (std::ranges::any_of(client.entries, [&](const auto& entry) { return message.matches(*entry); }))
            clients.push_back(client.process);
    return clients;
}

void KXIPCServer::terminateWithDelegate(std::function<void()> selector) {
    removeAllClients();
    KXIPCCommon::terminateWithDelegate(std::move(selector));
}

void KXIPCServer::onAddListener(const KXNotification& notification) {
    const auto number = clientNumber(notification);
    if (!number) return;
    const auto weight = weigh(KXUserInfo(notification)[KX_IPC_PARAM_MSG_TABLE]);
    const auto known = m_clients.find(*number);
    if (weight + (known == m_clients.end() ? 0 : known->second.weight) > mostEntryBytes)
        return refuseEntries(*number);
    const auto added = KXIPCObserverEntry::observerEntryTableFromNotification(notification);
    if (!added) return;

    auto& client = m_clients[*number];
    client.entries.insert(client.entries.end(), added->begin(), added->end());
    client.weight += weight;
    if (client.process) return;

    client.process =
        KXProcess::processWithSerialNumber(context().processes, KXProcessSerialNumberFromNumber(*number));
    client.process->addObserverForProcessDeath(this, [this](KXProcess& process) {
        removeClient(KXNumberFromProcessSerialNumber(process.processSerialNumber()));
    });
    confirm(*client.process);
    // Its death came before the watch, so nothing will tell of it.
    if (!client.process->isValid()) removeClient(*number);
}

void KXIPCServer::refuseEntries(std::uint64_t number) {
    const auto client = std::to_string(KXProcessSerialNumberFromNumber(number).lowLongOfPSN);
    if (context().ports.mayLogAbout(client))
        Log("IPC: %s: dropping entries of process %s, which has too many\n", "-[KXIPCServer onAddListener:]",
            client.c_str());
}

void KXIPCServer::confirm(const KXProcess& client) {
    const KXIPCMessage message(KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION, context().mainBundleIdentifier,
                               plist::Dictionary{{KX_IPC_PARAM_PSN, processNumber()}});
    KX_IPC_SendMessageToNamedPort(context(), message, KX_IPC_PortNameForProcess(&client), false);
}

void KXIPCServer::onRemoveListener(const KXNotification& notification) {
    const auto number = clientNumber(notification);
    if (!number) return;
    if (KXUserInfo(notification)[KX_IPC_PARAM_ALL_MESSAGES].boolValue()) return removeClient(*number);
    if (!KXIPCObserverEntry::observerEntryTableFromNotification(notification)) return;
    // Removing the entries of that table looks right. They are compared by identity, and entries just read
    // from a message are never the stored ones: none ever leaves this way.
    const auto client = m_clients.find(*number);
    if (client != m_clients.end() && client->second.entries.empty()) removeClient(*number);
}

void KXIPCServer::removeClient(std::uint64_t number) {
    const auto client = m_clients.extract(number);
    // Others may keep the handle, which would call us after our end.
    if (client) client.mapped().process->removeObserverForProcessDeath(this);
}

void KXIPCServer::removeAllClients() {
    while (!m_clients.empty())
        removeClient(m_clients.begin()->first);
}
