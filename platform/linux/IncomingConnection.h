#pragma once

#include "platform/MessagePort.h"
#include "platform/linux/Backlog.h"
#include "platform/linux/PortPacket.h"

#include <mutex>

namespace platform {

/// The receiver's end of a sender's connection. Lives until the last of its receipts has ended.
class IncomingConnection : public std::enable_shared_from_this<IncomingConnection> {
public:
    IncomingConnection(Descriptor socket, PortPeer peer, std::shared_ptr<Backlog> backlog)
        : m_socket(std::move(socket))
        , m_peer(peer)
        , m_backlog(std::move(backlog)) {}

    int socket() const { return m_socket.get(); }
    const PortPeer& peer() const { return m_peer; }

    /// For a message that was read. It counts in the backlog; its end sends the answer, if the sender waits
    /// for one.
    std::unique_ptr<Receipt> receipt(const PacketHeader& header);

    /// Nothing more is read. Answers that are still due are sent first; then the sender sees the end.
    void close();

private:
    class MessageReceipt;
    void letGo(const PacketHeader& header);
    void answer(std::uint64_t sequence);

    const Descriptor m_socket;
    const PortPeer m_peer;
    const std::shared_ptr<Backlog> m_backlog;
    std::mutex m_mutex;
    int m_answersDue = 0;
    bool m_closed = false;
};

} // namespace platform
