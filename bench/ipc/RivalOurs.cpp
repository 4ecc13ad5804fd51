#include "bench/ipc/Transport.h"

#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCSend.h"
#include "lib/ipc/KXIPCServer.h"
#include "platform/linux/LinuxPorts.h"
#include "platform/linux/PollMainLoop.h"
#include "platform/linux/ProcProcessTable.h"

namespace {

/// This library, whole: what is sent is written as a property list, what arrives is parsed and dispatched.
class Ours final : public Transport {
public:
    explicit Ours(const std::string& directory)
        : m_ports(m_loop, directory + "/ports") {}

    void serve(Board& board) override {
        KXIPCServer server(m_context);
        const auto handle = [&](const KXNotification& notification) {
            // Pixels of the last application, when there are applications.
            const auto applications = KXUserInfo(notification)["menu"]["searchableApps"];
            const auto icons = applications.at(applications.size() - 1)["rawIcons"];
            board.touch(icons.at(icons.size() - 1)["data"].data());
            board.mark();
        };
        const KXIPCObserverEntryRow rows[] = {{"menu.update", handle, {}}, {"menu.refresh", handle, {}}};
        server.addEntries(KXIPCObserverEntryArray(rows, std::size(rows)), this);
        server.setAllowIncomingMessages(true);
        ++board.ready;
        m_loop.run();
    }
    void connect() override {}
    void send(const Payload& payload, bool wait) override {
        const bool isUpdate = !payload.userInfo["menu"].isNil();
        const KXIPCMessage message(isUpdate ? "menu.update" : "menu.refresh", {}, payload.userInfo);
        KX_IPC_SendMessageToNamedPort(m_context, message, KX_IPC_ServerPortName(), wait);
    }

private:
    platform::SystemClock m_clock;
    platform::PollMainLoop m_loop{m_clock};
    platform::ProcProcessTable m_processes{m_loop, m_clock};
    platform::LinuxPorts m_ports;
    KXIPCContext m_context{m_ports.ports(), m_ports.notifications(), m_loop, m_processes,
                           "com.example.bench"};
};

const Enrolled enrolled("ours", [](const std::string& place) -> std::unique_ptr<Transport> {
    return std::make_unique<Ours>(place);
});

} // namespace
