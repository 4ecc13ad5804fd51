#pragma once

#include "lib/base/LogLimit.h"
#include "platform/MainLoop.h"
#include "platform/MessagePort.h"

#include <condition_variable>
#include <map>
#include <mutex>
#include <set>

/// What the processes of a test share: the names and their owners. Any thread, under the mutex.
struct InMemoryPortNetwork {
    struct Mailbox;
    std::mutex mutex;
    std::condition_variable changed;
    std::map<std::string, std::shared_ptr<Mailbox>> owners;
};

/// The ports of one process of a test. A port that is closed or destroyed is one whose owner has ended.
class InMemoryPorts final : public platform::MessagePorts {
public:
    /// All must outlive it, but for what is still posted to the loop.
    InMemoryPorts(InMemoryPortNetwork& network, platform::MainLoop& mainLoop, platform::PortPeer self);

    Queued queue; ///< what is said of it; nothing really waits

    std::unique_ptr<platform::LocalPort> open(const std::string& name) override;
    std::unique_ptr<platform::RemotePort> connect(const std::string& name) override;
    bool isListening(const std::string& name) override;
    std::vector<std::string> listeningNames() override;
    void setHangUpHandler(HangUpHandler handler) override { m_hangUpHandler = std::move(handler); }
    Queued queued() const override { return queue; }
    bool mayLogAbout(const std::string& peer) override { return m_logLimit.allows(peer, {}); }

private:
    void noticeHangUp(const std::string& name);
    void postHangUp(const std::string& name);

    InMemoryPortNetwork& m_network;
    platform::MainLoop& m_mainLoop;
    platform::PortPeer m_self;
    HangUpHandler m_hangUpHandler;
    LogLimit m_logLimit; ///< of a minute that never ends
    std::map<std::string, std::shared_ptr<InMemoryPortNetwork::Mailbox>> m_connected;
    std::set<std::string> m_believed; ///< names whose owner somebody was told of
    std::set<std::string> m_ended;    ///< those whose owner has ended since
    std::shared_ptr<bool> m_alive = std::make_shared<bool>();
};
