#pragma once

#include "platform/linux/SealedMemory.h"

#include <array>
#include <chrono>
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
    static constexpr std::array<char, 4> expectedMagic{'K', 'X', 'P', 'C'};
    static constexpr std::uint16_t currentVersion = 1;

    std::array<char, 4> magic = expectedMagic;
    std::uint16_t version = currentVersion;
    std::uint16_t flags = 0;
    std::uint64_t payloadLength = 0;
    std::uint64_t sequence = 0; ///< names the message in its answer
};
static_assert(sizeof(PacketHeader) == 24);

/// More than this goes through memory.
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

/// A message on its way out.
class OutgoingPacket {
public:
    /// Borrows what goes inline until `own`; what does not is written to memory here. Nothing, with a
    /// warning, when it is too large or there is no memory.
    static std::optional<OutgoingPacket> make(BytePieces pieces, bool wantsAnswer, std::uint64_t sequence,
                                              std::size_t inlineLimit = maximalInlinePayload);

    void own();
    /// Never blocks.
    Sending send(int socket) const { return send(socket, m_header); }
    /// Several that own what goes inline, by one call. How many were taken; none: why not in `sending`.
    static std::size_t sendAll(int socket, std::span<const OutgoingPacket* const> packets, Sending& sending);
    static constexpr std::size_t largestGroup = 16;
    /// The same payload under other flags.
    Sending sendCopy(int socket, std::uint16_t flags, std::uint64_t sequence) const;
    bool wantsAnswer() const { return (m_header.flags & PacketHeader::wantsAnswer) != 0; }
    bool hasDescriptor() const { return static_cast<bool>(m_memory); }
    std::size_t size() const { return m_header.payloadLength; }
    std::uint64_t sequence() const { return m_header.sequence; }

private:
    class Envelope;
    Sending send(int socket, const PacketHeader& header) const;

    PacketHeader m_header;
    std::vector<std::span<const std::byte>> m_pieces;
    std::shared_ptr<std::vector<std::byte>> m_copy;
    Descriptor m_memory;
};

enum class Reading {
    packet,
    nothing, ///< for now
    end,
    bad,
};

struct IncomingPacket {
    PacketHeader header;
    SharedBytes payload;
    ucred sender{};
    const char* fault = nullptr; ///< when bad
};

/// Reads messages. Keeps the room for a packet, so one serves all connections of a thread.
class PacketReader {
public:
    enum class Expecting { messages, copies };
    explicit PacketReader(Expecting expected = Expecting::messages)
        : m_expected(expected) {}
    Reading read(int socket, IncomingPacket& packet); ///< never blocks

private:
    const Expecting m_expected;
    std::unique_ptr<std::byte[]> m_buffer = std::make_unique_for_overwrite<std::byte[]>(maximalInlinePayload);
};

Sending SendAnswer(int socket, std::uint64_t sequence);
/// Expects nothing but answers; never blocks.
Reading ReadAnswer(int socket, std::uint64_t& sequence);
/// The same, and waits for as long as `SetPatience` has said, or until a signal comes.
Reading AwaitAnswer(int socket, std::uint64_t& sequence);
void SetPatience(int socket, std::chrono::milliseconds time);

} // namespace platform
