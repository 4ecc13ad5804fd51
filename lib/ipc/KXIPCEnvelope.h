#pragma once

#include "lib/ipc/KXIPCMessage.h"
#include "platform/MessagePort.h"

#include <cstdint>
#include <string>

/// The dictionary around a message on the wire: "message", "psnKey", "messageID", "synchronous". Pure
/// functions, for any thread.

plist::Value KXIPCEnvelope(const KXIPCMessage& message, platform::ProcessSerialNumber sender,
                           std::int32_t messageID, bool synchronous);

/// Why this cannot be dispatched; empty when it can.
std::string KXIPCEnvelopeError(const plist::Value& envelope);

/// Whether the process that the envelope names, and the one that a control message in it names, is the one
/// that sent it. For an envelope without error. Of a sender that has ended, its process id alone must be
/// right.
bool KXIPCEnvelopeIsFrom(const plist::Value& envelope, const platform::PortPeer& sender);
