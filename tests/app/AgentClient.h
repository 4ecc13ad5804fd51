#pragma once

#include "lib/ipc/KXIPCClient.h"
#include "tests/support/InMemoryNotificationCenter.h"
#include "tests/support/InMemoryPorts.h"
#include "tests/support/InMemoryProcessTable.h"
#include "tests/support/ManualMainLoop.h"

/// The services that a client stands on, in memory.
struct AgentWire {
    ManualMainLoop mainLoop;
    InMemoryProcessTable processes;
    InMemoryPortNetwork portNetwork;
    InMemoryPorts ports{portNetwork, mainLoop, {1000, processes.currentProcess()}};
    InMemoryNotificationNetwork noticeNetwork;
    InMemoryNotificationCenter notices{noticeNetwork, mainLoop};
    KXIPCContext context{ports, notices, mainLoop, processes, "com.corvane.tesselStartMenu"};
};

/// The real client, writing down what is asked of it. `receive` stands in for the server.
class AgentClient final : public KXIPCClient {
public:
    AgentClient(KXIPCContext& context, std::vector<std::string>& record)
        : KXIPCClient(context)
        , m_record(record) {}

    void setAllowIncomingMessages(bool allow) override {
        m_record.emplace_back(allow ? "allow" : "disallow");
        KXIPCClient::setAllowIncomingMessages(allow);
    }
    void addEntries(const KXIPCObserverEntry::Array& entries, const void* observer) override {
        for (const auto& entry : entries)
            m_record.push_back("add " + *entry->name());
        KXIPCClient::addEntries(entries, observer);
    }
    void removeEntries(const KXIPCObserverEntry::Array& entries, const void* observer) override {
        m_record.push_back("remove " + std::to_string(entries.size()) + " entries");
        KXIPCClient::removeEntries(entries, observer);
    }
    void postMessage(const KXIPCMessage& message, bool synchronously) override {
        m_record.push_back("post " + *message.name() + (synchronously || message.object() ? " oddly" : ""));
        lastUserInfo = message.userInfo();
    }
    void terminateWithDelegate(std::function<void()> selector) override {
        m_record.emplace_back(selector ? "terminate with delegate" : "terminate");
        KXIPCClient::terminateWithDelegate(std::move(selector));
    }
    void receive(const char* name, plist::Value userInfo = {}) {
        KXIPCClient::postMessage(KXIPCMessage(name, {}, std::move(userInfo)), false);
    }
    plist::Value lastUserInfo;

private:
    std::vector<std::string>& m_record;
};
