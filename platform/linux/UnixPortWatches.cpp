#include "platform/linux/UnixPortWatches.h"

#include "platform/MainLoop.h"
#include "platform/PortWatch.h"
#include "platform/linux/Descriptor.h"
#include "platform/linux/OutgoingMessage.h"
#include "platform/linux/PortPacket.h"

#include <cstdint>
#include <memory>
#include <string>
#include <utility>

namespace platform {

namespace {

class Watch final : public Handle {
public:
    Watch(MainLoop& mainLoop, Descriptor socket, PortWatchDelegate& delegate)
        : m_delegate(delegate)
        , m_socket(std::move(socket))
        , m_watch(mainLoop.watchReadable(m_socket.get(), [this] { read(); })) {}

private:
    /// One packet a turn: the delegate may end this handle.
    void read() {
        switch (m_reader.read(m_socket.get())) {
        case Reading::packet:
            return tell();
        case Reading::nothing:
            return;
        default:
            m_watch.reset();
            return m_delegate.onEnd();
        }
    }

    void tell() {
        const auto copy = std::move(m_reader.packet().messages.front());
        const auto flags = copy.header.flags;
        if ((flags & PacketHeader::isAnswer) != 0) return m_delegate.onStatistics(copy.payload);
        const auto count = static_cast<std::uint32_t>(copy.header.sequence >> 32);
        const std::uint32_t missed = count - m_next;
        m_next = count + 1;
        m_delegate.onMessage({(flags & PacketHeader::outgoing) != 0,
                              static_cast<int>(copy.header.sequence & 0xFFFFFFFF),
                              copy.header.wantsAnAnswer(), missed, copy.payload});
    }

    PortWatchDelegate& m_delegate;
    Descriptor m_socket;
    PacketReader m_reader{PacketReader::Expecting::copies};
    std::uint32_t m_next = 0;
    std::unique_ptr<Handle> m_watch;
};

} // namespace

std::unique_ptr<Handle> UnixPortWatches::watch(const std::string& name, PortWatchDelegate& delegate) {
    Descriptor socket;
    if (m_names.connect(name, socket) != PortNames::Connecting::done) return nullptr;
    const auto request = OutgoingMessage::make({}, false, 0);
    if (request->sendCopy(socket.get(), PacketHeader::tap, 0) != Sending::taken) return nullptr;
    return std::make_unique<Watch>(m_mainLoop, std::move(socket), delegate);
}

} // namespace platform
