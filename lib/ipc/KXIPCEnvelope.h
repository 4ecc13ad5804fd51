#pragma once

#include "lib/ipc/KXIPCMessage.h"
#include "platform/MessagePort.h"

#include <cstdint>

/// The dictionary around a message on the wire: "message", "psnKey", "messageID", "synchronous". Pure
/// functions, for any thread.

plist::Value KXIPCEnvelope(const KXIPCMessage& message, platform::ProcessSerialNumber sender,
                           std::int32_t messageID, bool synchronous);

/// What keeps an envelope from being dispatched.
struct KXIPCEnvelopeFault {
    const char* error = nullptr; ///< why it is no envelope; null when it is one
    bool isForged = false;       ///< it, or a control message in it, names another process than sent it

    bool any() const { return error || isForged; }
};

/// Of a sender that has ended, its process id alone must be right.
KXIPCEnvelopeFault KXIPCCheckEnvelope(const plist::Value& envelope, const platform::PortPeer& sender);
