#pragma once

#include "lib/ipc/KXIPCCommon.h"
#include "lib/kxAppKit/system/KXProcess.h"

#include <cstddef>
#include <cstdint>
#include <map>
#include <vector>

/// The server's end: knows which client wants which messages, and sends each message to those alone. One per
/// user's session. Receives nothing until `setAllowIncomingMessages(true)`.
///
/// Main thread only. A client is there from its first add message until it says otherwise or its process
/// ends; each gets its messages in the order of posting. Entries are not compared: those added twice are kept
/// twice. An add message that takes a client's entries past `mostEntryBytes`, each counted as its two strings
/// and 256 bytes, is logged and dropped as a whole. A message to a client that no longer listens is logged
/// and lost, and the client stays until its end is known.
class KXIPCServer : public KXIPCCommon {
public:
    static constexpr std::size_t mostEntryBytes = std::size_t{16} << 20;

    explicit KXIPCServer(KXIPCContext& context);
    ~KXIPCServer() override;
    KXIPCServer(const KXIPCServer&) = delete;
    KXIPCServer& operator=(const KXIPCServer&) = delete;

    std::string portName() const override;
    /// Broadcasts on every call whether the server is there now; nothing when it lost the race for its name.
    void setAllowIncomingMessages(bool allow) override;
    /// Synchronously: waits for each client before the next is sent to.
    void postMessage(const KXIPCMessage& message, bool synchronously) override;
    void terminateWithDelegate(std::function<void()> selector) override;

    /// The clients with an entry that the message matches, each once.
    std::vector<KXProcess::Pointer> clientsForMessage(const KXIPCMessage& message) const;

private:
    struct Client {
        KXIPCObserverEntry::Array entries;
        KXProcess::Pointer process;
        std::size_t weight = 0; ///< of the entries
    };
    void onAddListener(const KXNotification& notification);
    void onRemoveListener(const KXNotification& notification);
    void refuseEntries(std::uint64_t number);
    void removeClient(std::uint64_t number);
    void removeAllClients();
    void confirm(const KXProcess& client);

    std::map<std::uint64_t, Client> m_clients; ///< by serial number
};
