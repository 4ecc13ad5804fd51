#pragma once

#include "app/SMOptions.h"
#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCMessageReceiver.h"

#include <functional>

/// Owned by the one agent of a session.
inline constexpr const char* SMAgentPortName = "com.corvane.tesselStartMenu";

/// Makes this process the session's agent, if there is no other, and takes other processes' commands. Main
/// thread only; the context must outlive it.
class SMAgentPort final : private KXIPCMessageReceiverDelegate {
public:
    /// `handler` is called from the main loop, and may end the process.
    SMAgentPort(KXIPCContext& context, std::function<void(SMCommand)> handler);

    bool isOurs() const { return m_receiver.isPortOpen(); }

private:
    void onRemoteMessageReceived(const plist::Value& envelope) override;
    void onMessageReceiverDidTerminate() override {}

    std::function<void(SMCommand)> m_handler;
    KXIPCMessageReceiver m_receiver;
};

/// What became of a command.
struct SMOutcome {
    int exitCode = 0;
    const char* reason = ""; ///< for people, when it was not done
};

/// Tells the session's agent, and returns when it has obeyed, or has not for some seconds.
SMOutcome SMTellAgent(KXIPCContext& context, SMCommand command);
