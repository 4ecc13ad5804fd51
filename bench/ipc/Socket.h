#pragma once

#include <cstring>
#include <stdexcept>
#include <string>
#include <sys/socket.h>
#include <sys/un.h>

/// Bare Unix sockets, for the rivals that are no libraries.
inline int UnixSocket(int type, const std::string& path, bool listens) {
    const int made = socket(AF_UNIX, type | SOCK_CLOEXEC, 0);
    sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    path.copy(address.sun_path, sizeof address.sun_path - 1);
    const auto* general = reinterpret_cast<const sockaddr*>(&address);
    const int failed = listens ? bind(made, general, sizeof address) + listen(made, 8)
                               : ::connect(made, general, sizeof address);
    if (made < 0 || failed != 0) throw std::runtime_error("no socket at " + path);
    return made;
}
