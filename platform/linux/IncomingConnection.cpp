#include "platform/linux/IncomingConnection.h"

#include "platform/MessagePort.h"
#include "platform/linux/PortAnswer.h"
#include "platform/linux/PortPacket.h"

#include <cstdint>
#include <memory>
#include <mutex>
#include <sys/socket.h>
#include <utility>

namespace platform {

class IncomingConnection::MessageReceipt final : public Receipt {
public:
    MessageReceipt(std::shared_ptr<IncomingConnection> connection, const PacketHeader& header)
        : m_connection(std::move(connection))
        , m_header(header) {}
    ~MessageReceipt() override { m_connection->letGo(m_header); }
    MessageReceipt(const MessageReceipt&) = delete;
    MessageReceipt& operator=(const MessageReceipt&) = delete;

private:
    std::shared_ptr<IncomingConnection> m_connection;
    PacketHeader m_header;
};

std::unique_ptr<Receipt> IncomingConnection::receipt(const PacketHeader& header) {
    m_backlog->add(m_peer.processID, header.payloadLength);
    if (header.wantsAnAnswer()) {
        const std::lock_guard lock(m_mutex);
        ++m_answersDue;
    }
    return std::make_unique<MessageReceipt>(shared_from_this(), header);
}

void IncomingConnection::close() {
    const std::lock_guard lock(m_mutex);
    m_closed = true;
    shutdown(socket(), m_answersDue > 0 ? SHUT_RD : SHUT_RDWR);
}

void IncomingConnection::letGo(const PacketHeader& header) {
    if (header.wantsAnAnswer()) answer(header.sequence);
    m_backlog->remove(m_peer.processID, header.payloadLength);
}

void IncomingConnection::answer(std::uint64_t sequence) {
    // A sender that leaves its answers unread until there is no room for them is cut off. Not locked: it
    // may send again, and be read, before this returns.
    const bool sent = SendAnswer(socket(), sequence) == Sending::taken;
    const std::lock_guard lock(m_mutex);
    --m_answersDue;
    if (!sent || (m_closed && m_answersDue == 0)) shutdown(socket(), SHUT_RDWR);
}

} // namespace platform
