#pragma once

#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCMessage.h"
#include "lib/ipc/KXIPCMessageReceiver.h"
#include "lib/ipc/KXIPCObserverEntry.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

/// What client and server share: the local observers, the receiver, and the dispatch of what arrives.
/// Main thread only. A sender's messages are dispatched in the order of their numbers, those of different
/// senders in order of arrival; one whose number is not above its sender's last is logged and dropped.
/// Observers are called in the order in which they came, and their entries likewise. Observers are tokens,
/// never dereferenced: remove an observer's entries before it goes away. Only the selector of
/// `terminateWithDelegate` may destroy the object that calls it, also while a message is dispatched. The
/// last numbers of senders that have ended are forgotten from time to time.
class KXIPCCommon : public KXIPCMessageReceiverDelegate {
public:
    explicit KXIPCCommon(KXIPCContext& context);
    ~KXIPCCommon() override;
    KXIPCCommon(const KXIPCCommon&) = delete;
    KXIPCCommon& operator=(const KXIPCCommon&) = delete;

    virtual std::string portName() const { return {}; }
    bool allowIncomingMessages() const { return m_messageReceiver.messageReceiverThread(); }
    virtual void setAllowIncomingMessages(bool allow);
    /// Whether messages can reach us: they cannot, though allowed, when another process has the name.
    bool isReachable() const { return m_messageReceiver.isPortOpen(); }

    /// An entry added twice is called twice. Entries may be added and removed while a message is dispatched;
    /// one that was removed is not called.
    virtual void addEntries(const KXIPCObserverEntry::Array& entries, const void* observer);
    /// Removes all that the given entries stand for, not only the entries themselves.
    virtual void removeEntries(const KXIPCObserverEntry::Array& entries, const void* observer);

    /// Calls the local observers before it returns; client and server then send.
    virtual void postMessage(const KXIPCMessage& message, bool synchronously);

    /// Forgets all observers, ends receiving, and calls `selector` once that is done: at once when nothing
    /// was being received.
    virtual void terminateWithDelegate(std::function<void()> selector);

    void onRemoteMessageReceived(const plist::Value& envelope) override;
    void onMessageReceiverDidTerminate() override;

protected:
    KXIPCContext& context() const { return m_context; }
    /// Whether this object is still there afterwards.
    [[nodiscard]] bool dispatchMessageToLocalListeners(const KXIPCMessage& message);
    /// The entries of all observers, in the order in which observers came.
    KXIPCObserverEntry::Array allEntries() const;
    /// This process in the form in which it travels.
    std::uint64_t processNumber() const;

private:
    struct Observer {
        const void* token;
        std::shared_ptr<KXIPCObserverEntry::Array> entries; ///< shared with a dispatch under way

        KXIPCObserverEntry::Array& changeableEntries();
    };
    Observer* find(const void* token);
    bool dispatch(const KXIPCMessage& message, const Observer& observer);
    void forgetEndedSenders();

    KXIPCContext& m_context;
    std::vector<Observer> m_observerTable;                 ///< only ever grows, or is emptied as a whole
    std::unordered_map<const void*, std::size_t> m_places; ///< in the table, by token
    std::uint64_t m_removals = 0; ///< tells a dispatch under way whether to look again before it calls
    std::unordered_map<std::uint64_t, std::int32_t> m_lastMessageIDs; ///< by sender
    std::size_t m_mostSenders = 1024; ///< before it is asked which of them have ended
    std::shared_ptr<const bool> m_alive = std::make_shared<bool>();
    std::function<void()> m_terminateSelector;
    KXIPCMessageReceiver m_messageReceiver;
};
