#pragma once

#include "platform/linux/InotifyNotificationCenter.h"
#include "platform/linux/PeerIdentity.h"
#include "platform/linux/UnixMessagePorts.h"
#include "tests/support/InMemoryNotificationCenter.h"
#include "tests/support/InMemoryPorts.h"
#include "tests/support/ManualMainLoop.h"
#include "tests/support/ScratchHome.h"

#include <thread>

/// Two processes with ports and notices, in memory.
struct InMemoryWorld {
    ScratchHome home;
    ManualMainLoop loop;
    InMemoryPortNetwork network;
    platform::PortPeer clientPeer{77, platform::ProcessSerialNumber{5, 77}};
    InMemoryPorts server{network, loop, {66, platform::ProcessSerialNumber{4, 66}}};
    InMemoryPorts client{network, loop, clientPeer};
    InMemoryNotificationNetwork notices;
    InMemoryNotificationCenter serverNotices{notices, loop};
    InMemoryNotificationCenter clientNotices{notices, loop};
};

/// The same on the system's means, within one process.
struct UnixWorld {
    ScratchHome home;
    ManualMainLoop loop;
    ManualClock clock;
    std::string directory = home.path() / "ports";
    platform::PortPeer clientPeer{getpid(), platform::SerialNumberOfPeer(getpid())};
    platform::UnixMessagePorts server{loop, clock, directory};
    platform::UnixMessagePorts client{loop, clock, directory};
    platform::InotifyNotificationCenter serverNotices{loop, directory};
    platform::InotifyNotificationCenter clientNotices{loop, directory};
};

/// Receives under a name on a thread of its own, and keeps what comes, receipts too, for the main thread.
class Listener {
public:
    /// `onArrival` sees the messages first, on the listener's thread.
    Listener(ManualMainLoop& loop, platform::MessagePorts& ports, const std::string& name,
             std::function<void(platform::Arrival&)> onArrival = nullptr)
        : m_loop(loop)
        , m_onArrival(std::move(onArrival))
        , m_port(ports.open(name))
        , m_thread([this] {
            if (!m_port) return;
            m_port->run([this](std::span<platform::Arrival> arrivals) {
                for (auto& arrival : arrivals)
                    take(std::move(arrival));
            });
        }) {}
    ~Listener() {
        close();
        m_thread.join();
        m_loop.runPending();
    }

    void close() {
        if (m_port) m_port->close();
    }
    bool waitFor(std::size_t count) {
        return m_loop.runUntil([&] { return m_arrivals.size() >= count; });
    }
    std::vector<platform::Arrival>& arrivals() { return m_arrivals; }
    std::string text(std::size_t index) const {
        const auto& bytes = m_arrivals.at(index).bytes;
        return {reinterpret_cast<const char*>(bytes.data()), bytes.size()};
    }

private:
    void take(platform::Arrival arrival) {
        if (m_onArrival) m_onArrival(arrival);
        m_loop.post([this, kept = std::make_shared<platform::Arrival>(std::move(arrival))] {
            m_arrivals.push_back(std::move(*kept));
        });
    }

    ManualMainLoop& m_loop;
    const std::function<void(platform::Arrival&)> m_onArrival;
    const std::unique_ptr<platform::LocalPort> m_port;
    std::vector<platform::Arrival> m_arrivals;
    std::thread m_thread;
};

inline platform::SendStatus Send(platform::RemotePort& port, const std::string& text,
                                 bool synchronous = false,
                                 std::chrono::milliseconds receiveTimeout = std::chrono::seconds(20)) {
    // In two pieces, to be joined on the way.
    const auto bytes = std::as_bytes(std::span(text));
    const std::array pieces{bytes.first(text.size() / 2), bytes.subspan(text.size() / 2)};
    return port.send(pieces, synchronous, {std::chrono::seconds(20), receiveTimeout});
}
