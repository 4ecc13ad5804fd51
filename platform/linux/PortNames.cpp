#include "platform/linux/PortNames.h"

#include "lib/base/Log.h"
#include "platform/linux/Descriptor.h"
#include "platform/linux/PortLeftovers.h"
#include "platform/linux/PrivateDirectory.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <memory>
#include <optional>
#include <stdio.h>
#include <string>
#include <sys/file.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>
#include <utility>
#include <vector>

namespace platform {

namespace {

Descriptor NewSocket() {
    return Descriptor(socket(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC | SOCK_NONBLOCK, 0));
}

using Addressing = int (*)(int, const sockaddr*, socklen_t);

int BindOrConnect(Addressing function, const Descriptor& socket, const std::string& path) {
    sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    if (path.size() >= sizeof address.sun_path) {
        errno = ENAMETOOLONG;
        return -1;
    }
    std::memcpy(address.sun_path, path.data(), path.size());
    return function(socket.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address);
}

/// Whoever came between opening and locking it may have removed it, and the next one makes another.
bool IsRemoved(int file) {
    struct stat status = {};
    return fstat(file, &status) != 0 || status.st_nlink == 0;
}

/// A listening socket that has the name, put there whole: who connects meets the old owner's or this one.
Descriptor Listen(int directory, const std::string& name) {
    const auto temporary = '.' + name;
    unlinkat(directory, temporary.c_str(), 0); // of an owner who ended in between
    auto socket = NewSocket();
    const int yes = 1;
    // Set before anyone connects: accepted sockets inherit it, so that no packet comes without credentials.
    if (socket && setsockopt(socket.get(), SOL_SOCKET, SO_PASSCRED, &yes, sizeof yes) == 0 &&
        BindOrConnect(bind, socket, PathInDirectory(directory, temporary)) == 0 &&
        listen(socket.get(), SOMAXCONN) == 0 &&
        renameat(directory, temporary.c_str(), directory, name.c_str()) == 0)
        return socket;
    Log("IPC: %s: unable to listen as %s: %s\n", "PortNames::take", name.c_str(), std::strerror(errno));
    return {};
}

/// The same under a higher number. The system closes a killed process's descriptors from the highest down,
/// and takes up to seconds for one of inotify: for so long its name would still be taken, and who connects be
/// let in.
Descriptor Raised(Descriptor low) {
    constexpr int aboveMostOthers = 512;
    Descriptor high(fcntl(low.get(), F_DUPFD_CLOEXEC, aboveMostOthers));
    return high ? std::move(high) : std::move(low);
}

} // namespace

void WidenSendBuffer(int socket) {
    constexpr int size = 512 * 1024;
    setsockopt(socket, SOL_SOCKET, SO_SNDBUF, &size, sizeof size);
}

OwnedName::OwnedName(std::shared_ptr<const Descriptor> directory, std::string name, Descriptor lock,
                     Descriptor listener)
    : m_directory(std::move(directory))
    , m_name(std::move(name))
    , m_lock(std::move(lock))
    , m_listener(std::move(listener)) {}

OwnedName::~OwnedName() {
    if (!m_listener) return;
    unlinkat(m_directory->get(), m_name.c_str(), 0);
    // Closing alone looks enough, and is not while a child that was forked elsewhere has not yet executed.
    shutdown(m_listener.get(), SHUT_RDWR);
    flock(m_lock.get(), LOCK_UN);
}

PortNames::PortNames(const std::string& directory)
    : m_directory(std::make_shared<const Descriptor>(OpenPrivateDirectory(AT_FDCWD, directory))) {}

std::optional<OwnedName> PortNames::take(const std::string& name) const {
    if (!*m_directory || !IsPortName(name)) return std::nullopt;
    RemoveLeftovers(m_directory->get());
    constexpr int flags = O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK;
    Descriptor lock(openat(m_directory->get(), (name + ".lock").c_str(), flags, S_IRUSR | S_IWUSR));
    if (!lock || flock(lock.get(), LOCK_EX | LOCK_NB) != 0 || IsRemoved(lock.get())) return std::nullopt;
    auto listener = Listen(m_directory->get(), name);
    if (!listener) return std::nullopt;
    return OwnedName(m_directory, name, Raised(std::move(lock)), Raised(std::move(listener)));
}

PortNames::Connecting PortNames::connect(const std::string& name, Descriptor& socket) const {
    if (!*m_directory || !IsPortName(name)) return Connecting::refused;
    socket = NewSocket();
    if (!socket) return Connecting::refused;
    WidenSendBuffer(socket.get());
    if (BindOrConnect(::connect, socket, PathInDirectory(m_directory->get(), name)) == 0)
        return Connecting::done;
    return errno == EAGAIN ? Connecting::busy : Connecting::refused;
}

bool PortNames::isListening(const std::string& name) const {
    Descriptor socket;
    return connect(name, socket) != Connecting::refused;
}

std::vector<std::string> PortNames::listeningNames() const {
    std::vector<std::string> names;
    if (!*m_directory) return names;
    for (auto& name : EntriesOf(m_directory->get()))
        if (isListening(name)) names.push_back(std::move(name));
    std::ranges::sort(names);
    return names;
}

} // namespace platform
