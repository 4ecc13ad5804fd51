#include "tools/kxipcCommands.h"

#include "lib/base/KXNotificationCenter.h"
#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCMessage.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCObserverEntry.h"
#include "lib/ipc/KXIPCSend.h"
#include "lib/plist/Binary.h"
#include "lib/plist/Value.h"
#include "platform/MessagePort.h"
#include "tools/kxipcArguments.h"

#include <any>
#include <fstream>
#include <functional>
#include <ios>
#include <istream>
#include <iterator>
#include <optional>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

namespace {

constexpr int done = 0, failed = 1;

const std::vector<std::string> menuNames{"menu.update", "menu.show", "menu.hide",
                                         KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION};

int fail(std::ostream& errors, const std::string& why) {
    errors << "kxipc: " << why << '\n';
    return failed;
}

/// The dictionary in a file, or nil and why in `error`.
plist::Value readDictionary(const std::string& file, std::istream& input, std::string& error) {
    std::ifstream stream;
    if (file != "-") stream.open(file, std::ios::binary);
    const std::string bytes(std::istreambuf_iterator<char>(file == "-" ? input : stream), {});
    if (file != "-" && !stream.is_open()) {
        error = "cannot be read";
        return {};
    }
    auto value = plist::Parse(plist::Data::copyOf(bytes.data(), bytes.size()), error);
    if (value.isDictionary()) return value;
    if (error.empty()) error = "holds no dictionary";
    return {};
}

} // namespace

int KxipcPorts(platform::MessagePorts& ports, std::ostream& output) {
    for (const auto& name : ports.listeningNames())
        output << name << '\n';
    return done;
}

int KxipcPost(KXIPCContext& context, const KxipcArguments& arguments, std::istream& input,
              std::ostream& errors) {
    plist::Value userInfo;
    if (!arguments.file.empty()) {
        std::string error;
        userInfo = readDictionary(arguments.file, input, error);
        if (userInfo.isNil()) return fail(errors, arguments.file + ": " + error);
    }
    if (!context.ports.isListening(KX_IPC_ServerPortName())) return fail(errors, "there is no server");
    const KXIPCMessage message(arguments.names.front(), {}, std::move(userInfo));
    KX_IPC_SendMessageToNamedPort(context, message, KX_IPC_ServerPortName(), false);
    return done;
}

KxipcListener::KxipcListener(KXIPCContext& context, const std::vector<std::string>& names,
                             std::ostream& output)
    : m_output(output)
    , m_client(context) {
    std::vector<KXIPCObserverEntryRow> table;
    for (const auto& name : names.empty() ? menuNames : names)
        table.push_back(
            {name.c_str(), [this](const KXNotification& notification) { print(notification); }, {}});
    m_client.addEntries(KXIPCObserverEntryArray(table.data(), table.size()), this);
}

int KxipcListener::start(std::ostream& errors) {
    m_client.setAllowIncomingMessages(true);
    if (!m_client.isReachable()) return fail(errors, "cannot open a port");
    if (!m_client.isConnected()) errors << "kxipc: waiting for a server\n";
    return done;
}

void KxipcListener::stop(std::function<void()> whenStopped) {
    m_client.terminateWithDelegate(std::move(whenStopped));
}

void KxipcListener::print(const KXNotification& notification) {
    const auto* object = std::any_cast<std::string>(&notification.object);
    const KXIPCMessage message(notification.name, object ? std::optional(*object) : std::nullopt,
                               KXUserInfo(notification));
    m_output << message.description() << std::flush;
}
