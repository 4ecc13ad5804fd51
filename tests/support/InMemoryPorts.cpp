#include "tests/support/InMemoryPorts.h"

#include <algorithm>

using namespace platform;

struct InMemoryPortNetwork::Waiter {
    std::optional<SendStatus> outcome;
};

struct InMemoryPortNetwork::Mailbox {
    struct Letter {
        Arrival arrival;
        std::shared_ptr<Waiter> waiter;
    };
    std::deque<Letter> letters;
    bool closed = false;
    std::vector<std::function<void()>> hangUps; ///< one for every process that is connected
};

class InMemoryReceipt final : public Receipt {
public:
    InMemoryReceipt(InMemoryPortNetwork& network, std::shared_ptr<InMemoryPortNetwork::Waiter> waiter)
        : m_network(network)
        , m_waiter(std::move(waiter)) {}
    ~InMemoryReceipt() override {
        if (!m_waiter) return;
        std::lock_guard lock(m_network.m_mutex);
        if (!m_waiter->outcome) m_waiter->outcome = SendStatus::success;
        m_network.m_changed.notify_all();
    }

private:
    InMemoryPortNetwork& m_network;
    std::shared_ptr<InMemoryPortNetwork::Waiter> m_waiter;
};

class InMemoryLocalPort final : public LocalPort {
public:
    InMemoryLocalPort(InMemoryPortNetwork& network, std::string name)
        : m_network(network)
        , m_name(std::move(name)) {}
    ~InMemoryLocalPort() override { close(); }

    bool take() {
        std::lock_guard lock(m_network.m_mutex);
        return m_network.m_owners.try_emplace(m_name, m_mailbox).second;
    }

    void run(const Receiver& receiver) override {
        std::unique_lock lock(m_network.m_mutex);
        for (;;) {
            m_network.m_changed.wait(lock, [&] { return m_mailbox->closed || !m_mailbox->letters.empty(); });
            if (m_mailbox->closed) return;
            auto letter = std::move(m_mailbox->letters.front());
            m_mailbox->letters.pop_front();
            lock.unlock();
            letter.waiter.reset();
            std::vector<Arrival> arrivals;
            arrivals.push_back(std::move(letter.arrival));
            receiver(std::move(arrivals));
            lock.lock();
        }
    }

    void close() override {
        std::deque<InMemoryPortNetwork::Mailbox::Letter> dropped; // ends after the lock
        std::vector<std::function<void()>> hangUps;
        {
            std::lock_guard lock(m_network.m_mutex);
            if (std::exchange(m_mailbox->closed, true)) return;
            const auto owner = m_network.m_owners.find(m_name);
            if (owner != m_network.m_owners.end() && owner->second == m_mailbox)
                m_network.m_owners.erase(owner);
            dropped.swap(m_mailbox->letters);
            hangUps.swap(m_mailbox->hangUps);
            for (auto& letter : dropped) {
                if (letter.waiter) letter.waiter->outcome = SendStatus::becameInvalid;
            }
            m_network.m_changed.notify_all();
        }
        for (auto& hangUp : hangUps)
            hangUp();
    }

private:
    InMemoryPortNetwork& m_network;
    std::string m_name;
    std::shared_ptr<InMemoryPortNetwork::Mailbox> m_mailbox =
        std::make_shared<InMemoryPortNetwork::Mailbox>();
};

class InMemoryRemotePort final : public RemotePort {
public:
    InMemoryRemotePort(InMemoryPortNetwork& network, std::shared_ptr<InMemoryPortNetwork::Mailbox> mailbox,
                       PortPeer self)
        : m_network(network)
        , m_mailbox(std::move(mailbox))
        , m_self(self) {}

    SendStatus send(std::span<const std::span<const std::byte>> pieces, bool synchronous,
                    Timeouts timeouts) override {
        std::vector<std::byte> joined;
        for (const auto piece : pieces)
            joined.insert(joined.end(), piece.begin(), piece.end());
        const auto waiter = synchronous ? std::make_shared<InMemoryPortNetwork::Waiter>() : nullptr;

        std::unique_lock lock(m_network.m_mutex);
        if (m_mailbox->closed) return SendStatus::isInvalid;
        m_mailbox->letters.push_back({{SharedBytes::copyOf(joined.data(), joined.size()), m_self,
                                       std::make_unique<InMemoryReceipt>(m_network, waiter)},
                                      waiter});
        m_network.m_changed.notify_all();
        if (!synchronous) return SendStatus::success;
        m_network.m_changed.wait_for(lock, timeouts.receive, [&] { return waiter->outcome.has_value(); });
        return waiter->outcome.value_or(SendStatus::receiveTimeout);
    }

private:
    InMemoryPortNetwork& m_network;
    std::shared_ptr<InMemoryPortNetwork::Mailbox> m_mailbox;
    PortPeer m_self;
};

InMemoryPorts::InMemoryPorts(InMemoryPortNetwork& network, MainLoop& mainLoop, PortPeer self)
    : m_network(network)
    , m_mainLoop(mainLoop)
    , m_self(self) {}

InMemoryPorts::~InMemoryPorts() = default;

std::unique_ptr<LocalPort> InMemoryPorts::open(const std::string& name) {
    auto port = std::make_unique<InMemoryLocalPort>(m_network, name);
    if (!port->take()) return nullptr;
    return port;
}

std::unique_ptr<RemotePort> InMemoryPorts::connect(const std::string& name) {
    noticeHangUp(name);
    std::lock_guard lock(m_network.m_mutex);
    const auto owner = m_network.m_owners.find(name);
    if (owner == m_network.m_owners.end()) {
        if (m_believed.erase(name) > 0) {
            m_ended.insert(name);
            postHangUp(name);
        }
        return nullptr;
    }
    const auto& mailbox = owner->second;
    if (m_connected.try_emplace(name, mailbox).second) {
        mailbox->hangUps.push_back([this, name, weak = std::weak_ptr(m_alive)] {
            if (const auto self = weak.lock()) postHangUp(name);
        });
    }
    return std::make_unique<InMemoryRemotePort>(m_network, mailbox, m_self);
}

bool InMemoryPorts::isListening(const std::string& name) {
    noticeHangUp(name);
    if (m_ended.erase(name) > 0) return false;
    std::lock_guard lock(m_network.m_mutex);
    const bool listening = m_network.m_owners.contains(name);
    if (listening)
        m_believed.insert(name);
    else
        m_believed.erase(name);
    return listening;
}

std::vector<std::string> InMemoryPorts::listeningNames() {
    std::lock_guard lock(m_network.m_mutex);
    std::vector<std::string> names;
    for (const auto& owner : m_network.m_owners)
        names.push_back(owner.first);
    return names;
}

void InMemoryPorts::noticeHangUp(const std::string& name) {
    std::lock_guard lock(m_network.m_mutex);
    const auto connected = m_connected.find(name);
    if (connected == m_connected.end() || !connected->second->closed) return;
    m_connected.erase(connected);
    if (m_believed.erase(name) > 0) m_ended.insert(name);
}

/// Any thread.
void InMemoryPorts::postHangUp(const std::string& name) {
    m_mainLoop.post([name, weak = std::weak_ptr(m_alive)] {
        const auto self = weak.lock();
        if (!self) return;
        (*self)->noticeHangUp(name);
        if ((*self)->m_hangUpHandler) (*self)->m_hangUpHandler(name);
    });
}
