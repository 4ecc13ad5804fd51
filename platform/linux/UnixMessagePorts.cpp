#include "platform/linux/UnixMessagePorts.h"

#include "platform/Clock.h"
#include "platform/MainLoop.h"
#include "platform/MessagePort.h"
#include "platform/linux/Destination.h"
#include "platform/linux/SealedMemory.h"
#include "platform/linux/UnixLocalPort.h"

#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace platform {

namespace {

class UnixRemotePort final : public RemotePort {
public:
    explicit UnixRemotePort(std::shared_ptr<Destination> destination)
        : m_destination(std::move(destination)) {}
    SendStatus send(BytePieces pieces, bool synchronous, Timeouts timeouts) override {
        return m_destination->send(pieces, synchronous, timeouts);
    }

private:
    std::shared_ptr<Destination> m_destination;
};

} // namespace

UnixMessagePorts::UnixMessagePorts(MainLoop& mainLoop, const Clock& clock, const std::string& directory)
    : m_mainLoop(mainLoop)
    , m_clock(clock)
    , m_names(directory)
    , m_flusher(std::in_place, clock) {}

UnixMessagePorts::~UnixMessagePorts() {
    m_flusher.reset(); // while all that it calls is there
}

std::unique_ptr<LocalPort> UnixMessagePorts::open(const std::string& name) {
    auto owned = m_names.take(name);
    if (!owned) return nullptr;
    auto port = std::make_unique<UnixLocalPort>(std::move(*owned), *this, m_tap);
    return port->canListen() ? std::move(port) : nullptr;
}

std::unique_ptr<RemotePort> UnixMessagePorts::connect(const std::string& name) {
    Destination::Delegate& delegate = *this;
    const auto known = m_destinations.find(name);
    const auto destination = known != m_destinations.end()
                                 ? known->second.destination
                                 : std::make_shared<Destination>(m_names, m_clock, m_tap, delegate, name);
    if (!destination->connect()) {
        // Who believes in an owner that we were never connected to will not hear of its end otherwise.
        if (destination->takeEnd() || m_believed.contains(name)) noteEnd(name);
        return nullptr;
    }
    // One that the flusher still held when its connection ended was left over.
    if (known == m_destinations.end())
        std::erase_if(m_destinations, [](const auto& entry) {
            const auto& other = entry.second.destination;
            return other.use_count() == 1 && other->isIdle();
        });
    m_destinations.try_emplace(name, Watched{destination});
    return std::make_unique<UnixRemotePort>(destination);
}

bool UnixMessagePorts::isListening(const std::string& name) {
    if (const auto known = m_destinations.find(name); known != m_destinations.end()) {
        known->second.destination->drain();
        if (known->second.destination->takeEnd()) noteEnd(name);
    }
    if (m_ended.erase(name) > 0) return false;
    const bool listening = m_names.isListening(name);
    if (listening)
        m_believed.insert(name);
    else
        m_believed.erase(name);
    return listening;
}

std::vector<std::string> UnixMessagePorts::listeningNames() {
    return m_names.listeningNames();
}

bool UnixMessagePorts::didQueue(std::shared_ptr<Destination> destination) {
    return m_flusher->add(std::move(destination));
}

void UnixMessagePorts::didChangeConnection(const std::string& name) {
    m_mainLoop.post([name, weak = std::weak_ptr(m_alive)] {
        if (const auto self = weak.lock()) (*self)->update(name);
    });
}

/// Follows what became of the connection to `name`.
void UnixMessagePorts::update(const std::string& name) {
    const auto found = m_destinations.find(name);
    if (found == m_destinations.end()) return;
    auto& watched = found->second;
    const auto destination = watched.destination;
    if (destination->takeEnd()) noteEnd(name);
    if (auto socket = destination->socket(); socket != watched.socket) {
        watched.watch.reset();
        watched.socket = std::move(socket);
        if (watched.socket)
            watched.watch =
                m_mainLoop.watchReadable(watched.socket->get(), [&d = *destination] { d.drain(); });
    }
    const bool isBorrowed = destination.use_count() > 2; // by more than the map and this function
    if (destination->isIdle() && !isBorrowed) m_destinations.erase(found);
}

void UnixMessagePorts::noteEnd(const std::string& name) {
    if (m_believed.erase(name) > 0) m_ended.insert(name);
    m_mainLoop.post([name, weak = std::weak_ptr(m_alive)] {
        const auto self = weak.lock();
        if (self && (*self)->m_hangUpHandler) (*self)->m_hangUpHandler(name);
    });
}

} // namespace platform
