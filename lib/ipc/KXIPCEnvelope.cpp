#include "lib/ipc/KXIPCEnvelope.h"

#include "lib/ipc/KXIPCMessage.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/kxAppKit/system/KXProcess.h"
#include "lib/plist/Value.h"
#include "platform/MessagePort.h"

#include <algorithm>
#include <cstdint>
#include <string_view>

namespace {

constexpr const char* controlMessages[] = {KX_IPC_ADD_LISTENER_NOTIFICATION,
                                           KX_IPC_REMOVE_LISTENER_NOTIFICATION,
                                           KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION};

bool isControlMessage(const plist::Value& message) {
    return std::ranges::any_of(
        controlMessages, [name = message["name"]](const char* known) { return name.equalsString(known); });
}

bool names(const plist::Value& number, const platform::PortPeer& sender) {
    const auto named = KXProcessSerialNumberFromNumber(number.unsignedLongLongValue());
    if (sender.serialNumber) return named == *sender.serialNumber;
    return named.lowLongOfPSN == static_cast<std::uint32_t>(sender.processID);
}

} // namespace

plist::Value KXIPCEnvelope(const KXIPCMessage& message, platform::ProcessSerialNumber sender,
                           std::int32_t messageID, bool synchronous) {
    return plist::Dictionary{{"message", message.propertyList()},
                             {"psnKey", KXNumberFromProcessSerialNumber(sender)},
                             {"messageID", messageID},
                             {"synchronous", synchronous}};
}

KXIPCEnvelopeFault KXIPCCheckEnvelope(const plist::Value& envelope, const platform::PortPeer& sender) {
    if (!envelope.isDictionary()) return {"the envelope is no dictionary"};
    const auto message = envelope["message"];
    if (!message.isDictionary()) return {"the envelope holds no message"};
    const auto named = envelope["psnKey"];
    if (named.type() != plist::Type::integer) return {"the envelope names no sender"};
    if (!names(named, sender)) return {.isForged = true};
    if (!isControlMessage(message)) return {};
    const auto number = message["userInfo"][KX_IPC_PARAM_PSN];
    return {.isForged = !number.isNil() && !names(number, sender)};
}
