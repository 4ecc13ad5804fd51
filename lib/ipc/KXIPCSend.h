#pragma once

#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCMessage.h"

#include <string>

/// Sends one message. Main thread only. Messages to one port arrive in the order of the calls.
///
/// Synchronously: returns once the receiver's main thread has handled it, it has died, or 1000 seconds have
/// passed. Two processes that send to each other so wait for each other. Asynchronously: never waits. What
/// the receiver does not take yet is kept, up to 65,536 messages, 256 MiB and 128 messages in memory for each
/// port, and for 1000 seconds.
///
/// What cannot be sent is logged and lost, and its number is used up: more than 256 MiB, a value that no
/// property list can hold, nobody listening; ten entries a minute for each port. What is dropped later is
/// logged once for each connection.
void KX_IPC_SendMessageToNamedPort(KXIPCContext& context, const KXIPCMessage& message,
                                   const std::string& portName, bool synchronous);
