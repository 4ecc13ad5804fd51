#pragma once

#include "platform/linux/SealedMemory.h"

#include <array>
#include <cstdint>
#include <memory>
#include <sys/socket.h>
#include <vector>

/// What goes over a connection between ports; docs/protocol.md has the layout.
namespace platform {

struct PacketHeader {
    enum Flag : std::uint16_t {
        wantsAnswer = 1 << 0,
        isAnswer = 1 << 1,
        inMemory = 1 << 2, ///< the payload is in the sealed memory that comes with the packet
        tap = 1 << 3,      ///< to a listener: the sender wants to watch; else a copy for one who does
        outgoing = 1 << 4, ///< a copy of what was sent, not of what was got
    };
    bool isTap() const { return (flags & tap) != 0; }
    bool isInMemory() const { return (flags & inMemory) != 0; }
    bool wantsAnAnswer() const { return (flags & wantsAnswer) != 0; }
    static constexpr std::array<char, 4> expectedMagic{'K', 'X', 'P', 'C'};
    static constexpr std::uint16_t currentVersion = 1;

    std::array<char, 4> magic = expectedMagic;
    std::uint16_t version = currentVersion;
    std::uint16_t flags = 0;
    std::uint64_t payloadLength = 0;
    std::uint64_t sequence = 0; ///< names the message in its answer
};
static_assert(sizeof(PacketHeader) == 24);

/// So many messages at most are in one packet.
constexpr std::size_t largestGroup = 16;
/// Messages go together up to this length of a packet; in longer ones they would save nothing.
constexpr std::size_t smallPacket = 8192;
/// More than this goes through memory, and a packet of several messages has no more after its first header.
constexpr std::size_t maximalInlinePayload = std::size_t{256} << 10;
/// How much goes inline where the system grants no larger send buffer than this.
constexpr std::size_t InlineLimit(int sendBuffer) {
    constexpr std::size_t overhead = 32 + sizeof(PacketHeader); // the system's own, and ours
    const auto room = static_cast<std::size_t>(sendBuffer) - overhead;
    return room < maximalInlinePayload ? room : maximalInlinePayload;
}
constexpr std::size_t maximalPayload = std::size_t{256} << 20;

enum class Sending {
    taken,
    busy,      ///< the receiver has to read first
    exhausted, ///< the system has to recover first
    hungUp,
    failed,
};

enum class Reading {
    packet,
    nothing, ///< for now
    end,
    bad,
};

struct IncomingMessage {
    PacketHeader header;
    SharedBytes payload;
    PeekBytes peek{}; ///< into a payload in memory
};

struct IncomingPacket {
    std::vector<IncomingMessage> messages; ///< one at least
    ucred sender{};
    const char* fault = nullptr; ///< when bad
};

/// Reads packets. Keeps the room for one, so one serves all connections of a thread.
class PacketReader {
public:
    enum class Expecting { messages, copies };
    explicit PacketReader(Expecting expected = Expecting::messages)
        : m_expected(expected) {}
    Reading read(int socket);                     ///< never blocks
    IncomingPacket& packet() { return m_packet; } ///< that was read last

private:
    void own(std::size_t length);

    static constexpr std::size_t maximalLength = sizeof(PacketHeader) + maximalInlinePayload;
    const Expecting m_expected;
    std::unique_ptr<std::byte[]> m_buffer = std::make_unique_for_overwrite<std::byte[]>(maximalLength);
    IncomingPacket m_packet;
};

} // namespace platform
