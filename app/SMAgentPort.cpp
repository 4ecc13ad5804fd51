#include "app/SMAgentPort.h"

#include "app/SMOptions.h"
#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCEnvelope.h"
#include "lib/ipc/KXIPCMessage.h"
#include "lib/plist/Binary.h"
#include "lib/plist/Value.h"
#include "platform/MessagePort.h"
#include "platform/ProcessTable.h"

#include <algorithm>
#include <chrono>
#include <functional>
#include <iterator>
#include <string>
#include <string_view>
#include <utility>

namespace {

struct Word {
    SMCommand command;
    std::string_view name; ///< of the message
};
constexpr Word words[] = {
    {SMCommand::toggle, "agent.toggle"},
    {SMCommand::show, "agent.show"},
    {SMCommand::hide, "agent.hide"},
    {SMCommand::quit, "agent.quit"},
};

constexpr platform::RemotePort::Timeouts patience{std::chrono::seconds(20), std::chrono::seconds(20)};

} // namespace

SMAgentPort::SMAgentPort(KXIPCContext& context, std::function<void(SMCommand)> handler)
    : m_handler(std::move(handler))
    , m_receiver(context, *this) {
    m_receiver.startReceivingWithPortName(SMAgentPortName);
}

void SMAgentPort::onRemoteMessageReceived(const plist::Value& envelope) {
    const auto message = KXIPCMessage::initWithInfo(envelope["message"]);
    const auto* word = std::ranges::find(words, message.name().value_or(""), &Word::name);
    if (word != std::end(words)) m_handler(word->command);
}

SMOutcome SMTellAgent(KXIPCContext& context, SMCommand command) {
    const auto port = context.ports.connect(SMAgentPortName);
    if (!port) return {1, "no start menu runs in this session"};
    const auto* word = std::ranges::find(words, command, &Word::command);
    std::string error;
    const auto self = context.processes.currentProcess().value_or(platform::ProcessSerialNumber{});
    const KXIPCMessage message(std::string(word->name), {}, {});
    const auto data = plist::WriteBinary(KXIPCEnvelope(message, self, ++context.messageCounter, true), error);
    const auto status = port->send(data.pieces, true, patience);
    if (status == platform::SendStatus::success) return {};
    const bool hasEnded = status == platform::SendStatus::becameInvalid;
    if (hasEnded && command == SMCommand::quit) return {};
    return {1, hasEnded ? "the start menu has ended: is there no daemon?" : "the start menu does not answer"};
}
