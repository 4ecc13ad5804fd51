#pragma once

#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCMessage.h"

#include <string>

/// Sends one message. Synchronously: returns once the receiver's main thread has handled it, it has died, or
/// 1000 seconds have passed. What cannot be sent is logged and lost; its number is used up. Main thread only.
void KX_IPC_SendMessageToNamedPort(KXIPCContext& context, const KXIPCMessage& message,
                                   const std::string& portName, bool synchronous);
