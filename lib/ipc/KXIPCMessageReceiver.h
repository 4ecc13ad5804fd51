#pragma once

#include "lib/ipc/KXIPCContext.h"
#include "lib/plist/Value.h"

#include <memory>
#include <string>
#include <vector>

/// Called on the main thread, from the main loop, never from within the receiver's own methods. Either call
/// may destroy the receiver.
class KXIPCMessageReceiverDelegate {
public:
    virtual ~KXIPCMessageReceiverDelegate() = default;
    /// Once for each arrived envelope that is well formed and tells its sender truly, in order of arrival. A
    /// sender that waits goes on when this returns.
    virtual void onRemoteMessageReceived(const plist::Value& envelope) = 0;
    /// Once for each start, after the last message: the port is closed, or could not be opened.
    virtual void onMessageReceiverDidTerminate() = 0;
};

/// One named port and the worker thread that reads and parses what arrives there. The worker never waits for
/// the main thread. Main thread only; the delegate must outlive it.
///
/// Of a sender 16 messages or 64 MiB wait here to be handled, of all together 4096 and 512 MiB, but for the
/// rest of each sender's last packet, which may be a message of any size or 16 in 256 KiB; what is more waits
/// at the senders. What cannot be parsed, or names another sender, is dropped with a log entry: ten a minute
/// and sender, with all else that is wrong with what it sends.
class KXIPCMessageReceiver {
public:
    KXIPCMessageReceiver(KXIPCContext& context, KXIPCMessageReceiverDelegate& delegate);
    /// Waits for the worker and withdraws what was not delivered, end notices too.
    ~KXIPCMessageReceiver();
    KXIPCMessageReceiver(const KXIPCMessageReceiver&) = delete;
    KXIPCMessageReceiver& operator=(const KXIPCMessageReceiver&) = delete;

    /// The port can be reached when this returns. A name that cannot be had is logged, and the end notice
    /// follows. Does nothing when started before and not stopped since.
    void startReceivingWithPortName(const std::string& portName);

    /// The port cannot be reached any more when this returns; the end notice follows. Never waits.
    void stopReceiving();

    /// From start to stop, even when the port could not be opened.
    bool messageReceiverThread() const { return m_messageReceiverThread != nullptr; }
    bool isPortOpen() const;
    /// Whether an end notice is still to come once this is stopped.
    bool willTerminate() const;

private:
    class Worker;
    KXIPCContext& m_context;
    KXIPCMessageReceiverDelegate& m_delegate;
    std::shared_ptr<Worker> m_messageReceiverThread;
    std::vector<std::shared_ptr<Worker>> m_stoppingThreads;
};
