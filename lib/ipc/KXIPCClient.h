#pragma once

#include "lib/ipc/KXIPCCommon.h"
#include "lib/kxAppKit/system/KXProcess.h"
#include "platform/DistributedNotificationCenter.h"

#include <memory>

/// The client's end: tells the server which messages its observers want, and follows the server's coming and
/// going. One per process. Receives nothing until `setAllowIncomingMessages(true)`.
///
/// Main thread only. What is posted reaches the server in the order of posting, and registrations with it;
/// while there is no server it is not kept. Its own end does not deregister: post nothing more, and let
/// `terminateWithDelegate` finish before.
class KXIPCClient : public KXIPCCommon {
public:
    explicit KXIPCClient(KXIPCContext& context);
    ~KXIPCClient() override;
    KXIPCClient(const KXIPCClient&) = delete;
    KXIPCClient& operator=(const KXIPCClient&) = delete;

    /// True from the moment the entries were sent; what is posted before that reaches local observers only.
    bool isConnected() const { return m_isConnected; }
    /// Known once the server has confirmed; else null.
    const KXProcess::Pointer& serverProcess() const { return m_serverProcess; }

    std::string portName() const override;
    void setAllowIncomingMessages(bool allow) override;
    void addEntries(const KXIPCObserverEntry::Array& entries, const void* observer) override;
    void removeEntries(const KXIPCObserverEntry::Array& entries, const void* observer) override;
    /// Fails as `KX_IPC_SendMessageToNamedPort` does, which does not change whether we are connected.
    void postMessage(const KXIPCMessage& message, bool synchronously) override;

    /// Looks for the server and registers with it, or deregisters when incoming messages are not allowed.
    void updateServerConnection();

private:
    void sendObserverEntries(const KXIPCObserverEntry::Array& entries, bool isAddEvent);
    void sendRemoveAll();
    void setServerProcess(KXProcess::Pointer process);
    void sendToServer(const KXIPCMessage& message, bool synchronously);
    void onConnectedToServer(const KXNotification& notification);
    void onHangUp(const std::string& portName);

    bool m_isConnected = false;
    KXProcess::Pointer m_serverProcess;
    std::unique_ptr<platform::Handle> m_launchObserver;
    std::unique_ptr<platform::Handle> m_terminateObserver;
};
