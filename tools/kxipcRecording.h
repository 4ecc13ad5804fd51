#pragma once

#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCMessage.h"
#include "platform/MainLoop.h"
#include "platform/PortWatch.h"

#include <functional>
#include <iosfwd>
#include <optional>
#include <string>
#include <vector>

/// A file of messages that passed a port: property lists, each after its length in 8 bytes, little-endian.
/// The first says which port, the others are a message each. One that was cut short can be read up to there.

/// Writes the start of a recording, and then each message as it comes.
void KxipcStartRecording(std::ostream& file, const std::string& port);
void KxipcRecord(std::ostream& file, const platform::PassingMessage& message, double seconds);

struct KxipcRecordedMessage {
    double seconds;
    KXIPCMessage message;
    bool synchronous;
};
/// The messages that went to a server, or those that went to clients. Nothing when it is no recording.
std::optional<std::vector<KxipcRecordedMessage>> KxipcReadRecording(std::istream& file, bool toServer);

/// Sends recorded messages again, as this process's own: with its number, in the envelope and in control
/// messages, and its message counter. None is sent while an earlier one still waits for the receiver, so none
/// is dropped for want of room.
class KxipcReplay {
public:
    /// All must outlive it. `onEnd` is called from the main loop once the last is on its way.
    KxipcReplay(KXIPCContext& context, std::vector<KxipcRecordedMessage> messages, std::string port,
                std::function<void()> onEnd);
    /// `speed` 0 is without pauses.
    void start(double speed);

private:
    void sendNext();
    void sendAfter(platform::MainLoop::Milliseconds pause);

    KXIPCContext& m_context;
    const std::vector<KxipcRecordedMessage> m_messages;
    const std::string m_port;
    const std::function<void()> m_onEnd;
    double m_speed = 1;
    std::size_t m_next = 0;
    std::unique_ptr<platform::Handle> m_timer;
};
