#include "lib/ipc/KXIPCClient.h"

#include "lib/base/KXNotificationCenter.h"
#include "lib/ipc/KXIPCCommon.h"
#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCMessage.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCObserverEntry.h"
#include "lib/ipc/KXIPCSend.h"
#include "lib/kxAppKit/system/KXProcess.h"
#include "lib/plist/Value.h"
#include "platform/MessagePort.h"

#include <utility>

KXIPCClient::KXIPCClient(KXIPCContext& context)
    : KXIPCCommon(context)
    , m_launchObserver(context.notifications.observe(KX_IPC_SERVER_DID_LAUNCH_NOTIFICATION,
                                                     [this] { updateServerConnection(); }))
    , m_terminateObserver(context.notifications.observe(KX_IPC_SERVER_DID_TERMINATE_NOTIFICATION,
                                                        [this] { updateServerConnection(); })) {
    context.ports.setHangUpHandler([this](const std::string& name) { onHangUp(name); });
    const KXIPCObserverEntryRow row{KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION,
                                    [this](const auto& notification) { onConnectedToServer(notification); },
                                    {}};
    KXIPCCommon::addEntries(KXIPCObserverEntryArray(&row, 1), this);
}

KXIPCClient::~KXIPCClient() {
    context().ports.setHangUpHandler(nullptr);
    setServerProcess(nullptr);
}

void KXIPCClient::setServerProcess(KXProcess::Pointer process) {
    // Others may keep the handle, which would call us after our end.
    if (m_serverProcess) m_serverProcess->removeObserverForProcessDeath(this);
    m_serverProcess = std::move(process);
}

std::string KXIPCClient::portName() const {
    return KX_IPC_PortNameForProcess(KXProcess::currentProcess(context().processes).get());
}

void KXIPCClient::setAllowIncomingMessages(bool allow) {
    KXIPCCommon::setAllowIncomingMessages(allow);
    updateServerConnection();
}

void KXIPCClient::addEntries(const KXIPCObserverEntry::Array& entries, const void* observer) {
    KXIPCCommon::addEntries(entries, observer);
    sendObserverEntries(entries, true);
}

void KXIPCClient::removeEntries(const KXIPCObserverEntry::Array& entries, const void* observer) {
    KXIPCCommon::removeEntries(entries, observer);
    sendObserverEntries(entries, false);
}

void KXIPCClient::postMessage(const KXIPCMessage& message, bool synchronously) {
    if (!dispatchMessageToLocalListeners(message)) return;
    if (m_isConnected) sendToServer(message, synchronously);
}

void KXIPCClient::sendToServer(const KXIPCMessage& message, bool synchronously) {
    KX_IPC_SendMessageToNamedPort(context(), message, KX_IPC_ServerPortName(), synchronously);
}

void KXIPCClient::sendObserverEntries(const KXIPCObserverEntry::Array& entries, bool isAddEvent) {
    if (!m_isConnected) return;
    plist::Array table;
    table.reserve(entries.size());
    for (const auto& entry : entries)
        table.push_back(entry->propertyList());
    const auto* name = isAddEvent ? KX_IPC_ADD_LISTENER_NOTIFICATION : KX_IPC_REMOVE_LISTENER_NOTIFICATION;
    sendToServer(
        {name,
         {},
         plist::Dictionary{{KX_IPC_PARAM_MSG_TABLE, std::move(table)}, {KX_IPC_PARAM_PSN, processNumber()}}},
        false);
}

void KXIPCClient::sendRemoveAll() {
    sendToServer({KX_IPC_REMOVE_LISTENER_NOTIFICATION,
                  {},
                  plist::Dictionary{{KX_IPC_PARAM_ALL_MESSAGES, true}, {KX_IPC_PARAM_PSN, processNumber()}}},
                 false);
}

void KXIPCClient::updateServerConnection() {
    const bool isServerPresent = context().ports.isListening(KX_IPC_ServerPortName());
    const bool wasConnected = m_isConnected;
    if (!isServerPresent) m_isConnected = false;

    if (allowIncomingMessages()) {
        if (!isServerPresent || wasConnected) return;
        // Before the sending, and not taken back when that fails: else the entries would not go out at all.
        m_isConnected = true;
        sendObserverEntries(allEntries(), true);
        return;
    }
    // Clearing `m_isConnected` here looks right; it stays, so the removal goes out again on every further
    // call and allowing messages again does not register again.
    if (isServerPresent && wasConnected) sendRemoveAll();
    setServerProcess(nullptr);
}

void KXIPCClient::onConnectedToServer(const KXNotification& notification) {
    const auto number = KXUserInfo(notification)[KX_IPC_PARAM_PSN].unsignedLongLongValue();
    setServerProcess(
        KXProcess::processWithSerialNumber(context().processes, KXProcessSerialNumberFromNumber(number)));
    m_serverProcess->addObserverForProcessDeath(this, [this](KXProcess&) { updateServerConnection(); });
}

void KXIPCClient::onHangUp(const std::string& portName) {
    if (portName != KX_IPC_ServerPortName()) return;
    // A new server may be there already, and its launch notice have come too early: the first of the two
    // forgets the dead server, the second finds the new one.
    context().notifications.postLocally(KX_IPC_SERVER_DID_TERMINATE_NOTIFICATION);
    context().notifications.postLocally(KX_IPC_SERVER_DID_LAUNCH_NOTIFICATION);
}
