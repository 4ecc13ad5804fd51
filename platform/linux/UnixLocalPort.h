#pragma once

#include "platform/MessagePort.h"
#include "platform/linux/PortNames.h"
#include "platform/linux/PortPacket.h"
#include "platform/linux/PortTap.h"

#include <atomic>
#include <cstdint>
#include <mutex>
#include <unordered_map>
#include <vector>

namespace platform {

class Backlog;
class IncomingConnection;

/// A port under a name of ours. Senders are served in turns, a few packets each, so that none crowds out
/// another, and one who is ahead of the main thread is not read until that has caught up. Who sends what is
/// no packet, or in another process's name, is cut off.
class UnixLocalPort final : public LocalPort {
public:
    UnixLocalPort(OwnedName name, MessagePorts& ports, PortTap& tap);
    ~UnixLocalPort() override;
    UnixLocalPort(const UnixLocalPort&) = delete;
    UnixLocalPort& operator=(const UnixLocalPort&) = delete;

    /// False when the system had no descriptors for it.
    bool canListen() const { return m_canListen; }
    void run(const Receiver& receiver) override;
    void close() override;

private:
    bool watch(int descriptor, std::uint64_t tag);
    void accept();
    bool refuseOne();
    void rest(int error);
    void listenAgain();
    void read(std::uint64_t tag, PacketReader& reader, std::vector<Arrival>& group);
    bool readPacket(const IncomingConnection& connection, PacketReader& reader, bool& isOver);
    void take(const std::shared_ptr<IncomingConnection>& connection, IncomingMessage& message,
              std::vector<Arrival>& group);
    void pause(std::uint64_t tag);
    void resumePaused();
    void remove(std::uint64_t tag);
    void complain(int processID, const char* fault);

    MessagePorts& m_ports;
    PortTap& m_tap;
    const std::string m_label;
    const uid_t m_user;                             ///< whose packets are taken
    const std::shared_ptr<const Descriptor> m_wake; ///< receipts may outlive the port
    const std::shared_ptr<Backlog> m_backlog;
    Descriptor m_epoll;
    Descriptor m_spare; ///< given up for a moment to refuse a connection when there are no descriptors left
    bool m_canListen = false;
    bool m_rests = false; ///< since a connection could not be taken
    std::atomic<bool> m_closed = false;

    std::mutex m_mutex; ///< guards what follows
    std::optional<OwnedName> m_name;
    std::unordered_map<std::uint64_t, std::shared_ptr<IncomingConnection>> m_connections;
    std::vector<std::uint64_t> m_paused; ///< those not read for now
    std::uint64_t m_lastTag;
};

} // namespace platform
