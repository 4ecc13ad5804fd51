#pragma once

#include "platform/linux/PortPacket.h"

#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <memory>
#include <poll.h>
#include <string>
#include <sys/mman.h>
#include <sys/un.h>
#include <system_error>
#include <unistd.h>
#include <vector>

/// What a peer may send, byte for byte.
struct RawPacket {
    std::string what{};
    std::string bytes{};
    std::vector<std::shared_ptr<platform::Descriptor>> descriptors{};
};

inline std::string RawHeader(platform::PacketHeader header) {
    return {reinterpret_cast<const char*>(&header), sizeof header};
}

constexpr int allSeals = F_SEAL_SEAL | F_SEAL_SHRINK | F_SEAL_GROW | F_SEAL_WRITE;

/// What cannot be done throws, here and below.
inline void Require(bool success, const char* what) {
    if (!success) throw std::system_error(errno, std::generic_category(), what);
}

inline std::shared_ptr<platform::Descriptor> Memory(const std::string& contents, int seals) {
    auto memory =
        std::make_shared<platform::Descriptor>(memfd_create("test", MFD_CLOEXEC | MFD_ALLOW_SEALING));
    Require(write(memory->get(), contents.data(), contents.size()) >= 0, "write");
    Require(fcntl(memory->get(), F_ADD_SEALS, seals) == 0, "seal");
    return memory;
}

/// A peer without the library.
class RawPeer {
public:
    RawPeer(const std::string& directory, const std::string& name)
        : m_socket(socket(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0)) {
        const int room = 2 * platform::maximalInlinePayload;
        setsockopt(m_socket.get(), SOL_SOCKET, SO_SNDBUF, &room, sizeof room);
        sockaddr_un address = {};
        address.sun_family = AF_UNIX;
        (directory + '/' + name).copy(address.sun_path, sizeof address.sun_path - 1);
        Require(connect(m_socket.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0,
                "connect");
    }

    void send(const RawPacket& packet) { Require(trySend(packet), "send"); }

    /// The connection may be gone by now.
    bool trySend(const RawPacket& packet) {
        auto bytes = packet.bytes;
        iovec vector{bytes.data(), bytes.size()};
        msghdr message = {};
        message.msg_iov = &vector;
        message.msg_iovlen = 1;
        std::vector<int> numbers;
        for (const auto& descriptor : packet.descriptors)
            numbers.push_back(descriptor->get());
        std::vector<std::byte> control(CMSG_SPACE(numbers.size() * sizeof(int)));
        if (!numbers.empty()) {
            message.msg_control = control.data();
            message.msg_controllen = control.size();
            auto* rights = CMSG_FIRSTHDR(&message);
            *rights = {CMSG_LEN(numbers.size() * sizeof(int)), SOL_SOCKET, SCM_RIGHTS};
            std::memcpy(CMSG_DATA(rights), numbers.data(), numbers.size() * sizeof(int));
        }
        return sendmsg(m_socket.get(), &message, MSG_NOSIGNAL) >= 0;
    }

    bool hasReply(int milliseconds) {
        pollfd polled{m_socket.get(), POLLIN, 0};
        return poll(&polled, 1, milliseconds) == 1;
    }
    /// Like recv, waiting.
    ssize_t receive(void* to, std::size_t size) { return recv(m_socket.get(), to, size, 0); }

    /// Waits for the end of the connection; false when an answer comes instead, or nothing.
    bool isCutOff() {
        char byte = 0;
        return hasReply(20'000) && recv(m_socket.get(), &byte, 1, MSG_DONTWAIT) <= 0;
    }

private:
    platform::Descriptor m_socket;
};

inline std::string SmallMessages(std::size_t count) {
    std::string packet;
    for (; count > 0; --count)
        packet += RawHeader({.payloadLength = 7}) + "payload";
    return packet;
}

/// With eighteen messages.
inline std::vector<RawPacket> GoodPackets() {
    const auto header = RawHeader({.flags = platform::PacketHeader::inMemory, .payloadLength = 7});
    return {{"inline", SmallMessages(1)},
            {"in memory", header, {Memory("payload", allSeals)}},
            {"as many as go together", SmallMessages(platform::largestGroup)}};
}

inline std::vector<RawPacket> BadPackets() {
    using platform::Descriptor;
    using platform::PacketHeader;
    constexpr auto inMemory = PacketHeader::inMemory;
    const auto sealed = Memory("payload", allSeals);
    const auto file = std::make_shared<Descriptor>(open("/proc/self/exe", O_RDONLY | O_CLOEXEC));
    int pipeEnds[2];
    Require(pipe2(pipeEnds, O_CLOEXEC) == 0, "pipe");
    const auto pipe = std::make_shared<Descriptor>(pipeEnds[0]);
    const Descriptor otherEnd(pipeEnds[1]);
    const auto sparse = [](const char* what, std::size_t size) {
        const auto memory = Memory("", 0);
        Require(ftruncate(memory->get(), static_cast<off_t>(size)) == 0, "enlarge");
        Require(fcntl(memory->get(), F_ADD_SEALS, allSeals) == 0, "seal");
        return RawPacket{what, RawHeader({.flags = inMemory, .payloadLength = size}), {memory}};
    };
    const auto memoryHeader = RawHeader({.flags = inMemory, .payloadLength = 7});
    const std::string tooLong(platform::maximalInlinePayload + 1, 'x');
    std::vector<RawPacket> packets{
        {"half a header", RawHeader({}).substr(0, sizeof(PacketHeader) / 2)},
        {"another magic", RawHeader({.magic = {'K', 'X', 'P', 'D'}})},
        {"another version", RawHeader({.version = 2})},
        {"an unknown flag", RawHeader({.flags = 32})},
        {"a length too large by one", RawHeader({.payloadLength = 8}) + "payload"},
        {"a copy", RawHeader({.flags = PacketHeader::tap | PacketHeader::outgoing})},
        {"an answer", RawHeader({.flags = PacketHeader::isAnswer})},
        {"more than goes inline", RawHeader({.payloadLength = tooLong.size()}) + tooLong},
        {"no descriptor", memoryHeader},
        {"two descriptors", memoryHeader, {sealed, sealed}},
        {"ten descriptors", memoryHeader, std::vector(10, sealed)},
        {"a descriptor too many", RawHeader({.payloadLength = 7}) + "payload", {sealed}},
        {"payload in both places", memoryHeader + "payload", {sealed}},
        {"a file", memoryHeader, {file}},
        {"a pipe", memoryHeader, {pipe}},
        {"empty memory", RawHeader({.flags = inMemory}), {Memory("", allSeals)}},
        {"memory too small", RawHeader({.flags = inMemory, .payloadLength = 8}), {sealed}},
        {"memory too large", RawHeader({.flags = inMemory, .payloadLength = 6}), {sealed}},
        sparse("a byte more than the largest", platform::maximalPayload + 1),
        sparse("a sparse terabyte", std::size_t{1} << 40),
    };
    for (const int missing : {F_SEAL_SEAL, F_SEAL_SHRINK, F_SEAL_GROW, F_SEAL_WRITE})
        packets.push_back({"a seal missing", memoryHeader, {Memory("payload", allSeals & ~missing)}});
    for (const auto& packet : std::vector(packets))
        packets.push_back(
            {packet.what + ", behind another", SmallMessages(1) + packet.bytes, packet.descriptors});
    packets.push_back({"one too many", SmallMessages(platform::largestGroup + 1)});
    packets.push_back({"a byte behind the last", SmallMessages(2) + 'x'});
    packets.push_back({"memory behind another", SmallMessages(1) + memoryHeader, {sealed}});
    packets.push_back({"two of one memory", memoryHeader + memoryHeader, {sealed}});
    packets.push_back(
        {"a watcher behind another", SmallMessages(1) + RawHeader({.flags = PacketHeader::tap})});
    const auto half = RawHeader({.payloadLength = platform::maximalInlinePayload / 2}) +
                      std::string(platform::maximalInlinePayload / 2, 'x');
    packets.push_back({"more together than go inline", half + half});
    return packets;
}
