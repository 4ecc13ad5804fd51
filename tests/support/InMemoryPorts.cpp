#include "tests/support/InMemoryPorts.h"

using namespace platform;

/// Where a synchronous sender finds how it went.
using Outcome = std::shared_ptr<std::optional<SendStatus>>;

struct InMemoryPortNetwork::Mailbox {
    std::vector<Arrival> letters;
    bool closed = false;
    std::vector<std::function<void()>> hangUps; ///< one for every process that is connected
};
using Mailbox = std::shared_ptr<InMemoryPortNetwork::Mailbox>;

struct InMemoryReceipt final : Receipt {
    InMemoryReceipt(InMemoryPortNetwork& ours, Outcome senders)
        : network(ours)
        , outcome(std::move(senders)) {}
    ~InMemoryReceipt() override {
        if (!outcome) return;
        const std::lock_guard lock(network.mutex);
        *outcome = status;
        network.changed.notify_all();
    }

    InMemoryPortNetwork& network;
    Outcome outcome; ///< none: nobody waits
    SendStatus status = SendStatus::success;
};

struct InMemoryLocalPort final : LocalPort {
    explicit InMemoryLocalPort(InMemoryPortNetwork& ours)
        : network(ours) {}
    ~InMemoryLocalPort() override { close(); }

    void run(const Receiver& receiver) override {
        std::unique_lock lock(network.mutex);
        for (;;) {
            network.changed.wait(lock, [&] { return mailbox->closed || !mailbox->letters.empty(); });
            if (mailbox->closed) return;
            auto letters = std::exchange(mailbox->letters, {});
            lock.unlock();
            receiver(letters);
            letters.clear();
            lock.lock();
        }
    }

    void close() override {
        std::unique_lock lock(network.mutex);
        if (std::exchange(mailbox->closed, true)) return;
        std::erase_if(network.owners, [&](const auto& owner) { return owner.second == mailbox; });
        const auto dropped = std::exchange(mailbox->letters, {});
        const auto hangUps = std::exchange(mailbox->hangUps, {});
        network.changed.notify_all();
        lock.unlock(); // before what was dropped answers
        for (const auto& letter : dropped)
            static_cast<InMemoryReceipt&>(*letter.receipt).status = SendStatus::becameInvalid;
        for (const auto& hangUp : hangUps)
            hangUp();
    }

    InMemoryPortNetwork& network;
    const Mailbox mailbox = std::make_shared<InMemoryPortNetwork::Mailbox>();
};

struct InMemoryRemotePort final : RemotePort {
    InMemoryRemotePort(InMemoryPortNetwork& ours, Mailbox of, PortPeer from)
        : network(ours)
        , mailbox(std::move(of))
        , self(from) {}

    SendStatus send(std::span<const std::span<const std::byte>> pieces, bool synchronous,
                    Timeouts timeouts) override {
        std::vector<std::byte> joined;
        for (const auto piece : pieces)
            joined.insert(joined.end(), piece.begin(), piece.end());
        const auto outcome = synchronous ? std::make_shared<Outcome::element_type>() : nullptr;

        std::unique_lock lock(network.mutex);
        if (mailbox->closed) return SendStatus::isInvalid;
        mailbox->letters.push_back({SharedBytes::copyOf(joined.data(), joined.size()), self,
                                    std::make_unique<InMemoryReceipt>(network, outcome)});
        network.changed.notify_all();
        if (!synchronous) return SendStatus::success;
        network.changed.wait_for(lock, timeouts.receive, [&] { return outcome->has_value(); });
        return outcome->value_or(SendStatus::receiveTimeout);
    }

    InMemoryPortNetwork& network;
    Mailbox mailbox;
    PortPeer self;
};

InMemoryPorts::InMemoryPorts(InMemoryPortNetwork& network, MainLoop& mainLoop, PortPeer self)
    : m_network(network)
    , m_mainLoop(mainLoop)
    , m_self(self) {}

std::unique_ptr<LocalPort> InMemoryPorts::open(const std::string& name) {
    auto port = std::make_unique<InMemoryLocalPort>(m_network);
    const std::lock_guard lock(m_network.mutex); // ends before a port that is not to be
    if (!m_network.owners.try_emplace(name, port->mailbox).second) return nullptr;
    return port;
}

std::unique_ptr<RemotePort> InMemoryPorts::connect(const std::string& name) {
    noticeHangUp(name);
    const std::lock_guard lock(m_network.mutex);
    const auto owner = m_network.owners.find(name);
    if (owner == m_network.owners.end()) {
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
    const std::lock_guard lock(m_network.mutex);
    m_believed.erase(name);
    return m_network.owners.contains(name) && m_believed.insert(name).second;
}

std::vector<std::string> InMemoryPorts::listeningNames() {
    const std::lock_guard lock(m_network.mutex);
    std::vector<std::string> names;
    for (const auto& [name, owner] : m_network.owners)
        names.push_back(name);
    return names;
}

void InMemoryPorts::noticeHangUp(const std::string& name) {
    const std::lock_guard lock(m_network.mutex);
    const auto connected = m_connected.find(name);
    if (connected == m_connected.end() || !connected->second->closed) return;
    m_connected.erase(connected);
    if (m_believed.erase(name) > 0) m_ended.insert(name);
}

/// Any thread.
void InMemoryPorts::postHangUp(const std::string& name) {
    m_mainLoop.post([this, name, weak = std::weak_ptr(m_alive)] {
        const auto alive = weak.lock();
        if (!alive) return;
        noticeHangUp(name);
        if (m_hangUpHandler) m_hangUpHandler(name);
    });
}
