#pragma once

#include "lib/base/LogLimit.h"
#include "platform/Clock.h"
#include "platform/MainLoop.h"
#include "platform/MessagePort.h"
#include "platform/linux/Destination.h"
#include "platform/linux/PortFlusher.h"
#include "platform/linux/PortTap.h"

#include <map>
#include <set>

namespace platform {

/// Ports over Unix sockets in a directory of the user's.
class UnixMessagePorts final : public MessagePorts, private Destination::Delegate {
public:
    /// Loop and clock must outlive it.
    UnixMessagePorts(MainLoop& mainLoop, const Clock& clock, const std::string& directory);
    ~UnixMessagePorts() override;
    UnixMessagePorts(const UnixMessagePorts&) = delete;
    UnixMessagePorts& operator=(const UnixMessagePorts&) = delete;

    std::unique_ptr<LocalPort> open(const std::string& name) override;
    std::unique_ptr<RemotePort> connect(const std::string& name) override;
    bool isListening(const std::string& name) override;
    std::vector<std::string> listeningNames() override;
    void setHangUpHandler(HangUpHandler handler) override { m_hangUpHandler = std::move(handler); }
    Queued queued() const override { return {m_tap.counters.queued, m_tap.counters.dropped}; }
    bool mayLogAbout(const std::string& peer) override { return m_logLimit.allows(peer, m_clock.now()); }

private:
    /// A destination, and the connection of it that the main loop watches.
    struct Watched {
        std::shared_ptr<Destination> destination;
        Destination::Socket socket{};
        std::unique_ptr<Handle> watch{}; // ends before the socket does
    };

    bool didQueue(std::shared_ptr<Destination> destination) override;
    void didChangeConnection(const std::string& name) override;
    void update(const std::string& name);
    void noteEnd(const std::string& name);

    MainLoop& m_mainLoop;
    const Clock& m_clock;
    const PortNames m_names;
    PortTap m_tap;
    LogLimit m_logLimit;
    HangUpHandler m_hangUpHandler;
    std::map<std::string, Watched> m_destinations;
    std::set<std::string> m_believed; ///< names whose owner somebody was told of
    std::set<std::string> m_ended;    ///< those whose owner has ended since
    std::shared_ptr<UnixMessagePorts*> m_alive = std::make_shared<UnixMessagePorts*>(this);
    std::optional<PortFlusher> m_flusher;
};

} // namespace platform
