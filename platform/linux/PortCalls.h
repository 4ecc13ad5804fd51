#pragma once

#include "platform/linux/PortPacket.h"

#include <cerrno>
#include <cstddef>
#include <span>
#include <sys/socket.h>
#include <sys/types.h>

/// How the system's calls on sockets are made, for packets of all kinds.
namespace platform {

constexpr std::size_t controlSize = CMSG_SPACE(sizeof(ucred)) + CMSG_SPACE(sizeof(int));

union Control {
    cmsghdr alignment;
    std::byte bytes[controlSize];
};

constexpr int sendFlags = MSG_DONTWAIT | MSG_NOSIGNAL;

/// What the call returns, again while a signal interrupts it.
template <class Call>
auto Uninterrupted(const Call& call) {
    for (;;) {
        const auto result = call();
        if (result >= 0 || errno != EINTR) return result;
    }
}

/// Whatever the sender left unread when it closed is told once, before what it sent, which counts.
template <class Call>
ssize_t DespiteReset(const Call& receive) {
    const auto length = receive();
    return length < 0 && errno == ECONNRESET ? receive() : length;
}

/// Why a packet was not taken.
inline Sending SendingFromErrno() {
    switch (errno) {
    case EAGAIN:
        return Sending::busy;
    case ENOBUFS:
    case ENOMEM:
    case ETOOMANYREFS: // of descriptors on their way, in all of the user's sockets together
        return Sending::exhausted;
    case EPIPE:
    case ECONNRESET:
    case ENOTCONN:
        return Sending::hungUp;
    default:
        return Sending::failed;
    }
}

/// Sends a packet that is one run of bytes: for a tenth less than the call that gathers several.
inline Sending SendBytes(int socket, std::span<const std::byte> bytes) {
    const auto sent = Uninterrupted([&] { return ::send(socket, bytes.data(), bytes.size(), sendFlags); });
    return sent < 0 ? SendingFromErrno() : Sending::taken;
}

} // namespace platform
