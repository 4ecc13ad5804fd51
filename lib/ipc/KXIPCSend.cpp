#include "lib/ipc/KXIPCSend.h"

#include "lib/base/Log.h"
#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCEnvelope.h"
#include "lib/ipc/KXIPCMessage.h"
#include "lib/plist/Binary.h"
#include "platform/MessagePort.h"

#include <chrono>
#include <cstdint>
#include <string>

namespace {

// So long because a synchronous sender waits for the other side's main thread, however busy that is.
constexpr platform::RemotePort::Timeouts timeouts{std::chrono::seconds(1000), std::chrono::seconds(1000)};
constexpr int procNotFound = -600;

std::int32_t nextMessageID(KXIPCContext& context) {
    // A signed increment looks right, and is undefined after 2^31 - 1 messages.
    context.messageCounter =
        static_cast<std::int32_t>(static_cast<std::uint32_t>(context.messageCounter) + 1U);
    return context.messageCounter;
}

plist::Encoded SerializeMessage(KXIPCContext& context, const KXIPCMessage& message, bool synchronous) {
    const auto sender = context.processes.currentProcess();
    if (!sender) {
        Warning("IPC: %s: GetCurrentProcess returned error: %d\n", "SerializeMessage", procNotFound);
        return {};
    }
    std::string error;
    auto encoded =
        plist::WriteBinary(KXIPCEnvelope(message, *sender, nextMessageID(context), synchronous), error);
    if (encoded.pieces.empty())
        Warning("IPC: %s: unable to serialize data, error: %s\n", "SerializeMessage", error.c_str());
    return encoded;
}

} // namespace

void KX_IPC_SendMessageToNamedPort(KXIPCContext& context, const KXIPCMessage& message,
                                   const std::string& portName, bool synchronous) {
    constexpr auto routine = "KX_IPC_SendMessageToNamedPort";
    const auto data = SerializeMessage(context, message, synchronous);
    if (data.pieces.empty()) {
        Warning("IPC: %s: unable to serialize data\n", routine);
        return;
    }
    using Status = platform::SendStatus;
    const auto port = context.ports.connect(portName);
    const auto status = port ? port->send(data.pieces, synchronous, timeouts) : Status::isInvalid;
    if (status == Status::success || !context.ports.mayLogAbout(portName)) return;
    if (status == Status::isInvalid)
        Warning("IPC: %s: unable to create port, dropping message\n", routine);
    else
        Warning("IPC: %s: error %d sending message: %s\n", routine, static_cast<int>(status),
                message.name().value_or("(null)").c_str());
}
