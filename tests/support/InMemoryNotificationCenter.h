#pragma once

#include "platform/DistributedNotificationCenter.h"
#include "platform/linux/NoticeObservers.h"

#include <algorithm>
#include <vector>

/// What the processes of a test share. Main thread only.
struct InMemoryNotificationNetwork {
    std::vector<platform::DistributedNotificationCenter*> centers;
};

/// The notification centre of one process of a test.
class InMemoryNotificationCenter final : public platform::DistributedNotificationCenter {
public:
    /// Both must outlive it.
    InMemoryNotificationCenter(InMemoryNotificationNetwork& network, platform::MainLoop& mainLoop)
        : m_network(network)
        , m_mainLoop(mainLoop) {
        m_network.centers.push_back(this);
    }
    ~InMemoryNotificationCenter() override { std::erase(m_network.centers, this); }

    void post(const std::string& name) override {
        for (auto* center : m_network.centers)
            center->postLocally(name);
    }

    void postLocally(const std::string& name) override {
        m_mainLoop.post([name, weak = std::weak_ptr(m_observers)] {
            if (const auto observers = weak.lock()) observers->deliver(name);
        });
    }

    std::unique_ptr<platform::Handle> observe(const std::string& name,
                                              std::function<void()> handler) override {
        return m_observers->add(name, std::move(handler));
    }

private:
    InMemoryNotificationNetwork& m_network;
    platform::MainLoop& m_mainLoop;
    std::shared_ptr<platform::NoticeObservers> m_observers = std::make_shared<platform::NoticeObservers>();
};
