#include "platform/linux/UnixLocalPort.h"

#include "lib/base/Log.h"
#include "platform/MessagePort.h"
#include "platform/linux/Backlog.h"
#include "platform/linux/Descriptor.h"
#include "platform/linux/IncomingConnection.h"
#include "platform/linux/PeerIdentity.h"
#include "platform/linux/PortNames.h"
#include "platform/linux/PortPacket.h"
#include "platform/linux/PortTap.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <fcntl.h>
#include <memory>
#include <mutex>
#include <span>
#include <string>
#include <sys/epoll.h>
#include <sys/eventfd.h>
#include <sys/socket.h>
#include <unistd.h>
#include <utility>
#include <vector>

namespace platform {

namespace {
constexpr std::uint64_t wakeTag = 0;
constexpr std::uint64_t listenerTag = 1;
constexpr int connectionsOfSender = 16;       // the library keeps one, and opens another now and then to look
constexpr std::size_t connectionsOfAll = 512; // half of the descriptors that a process usually may have
constexpr int restMilliseconds = 100;
} // namespace

UnixLocalPort::UnixLocalPort(OwnedName name, MessagePorts& ports, PortTap& tap)
    : m_ports(ports)
    , m_tap(tap)
    , m_label(name.name())
    , m_user(geteuid())
    , m_wake(std::make_shared<const Descriptor>(eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)))
    , m_backlog(std::make_shared<Backlog>([wake = m_wake] { eventfd_write(wake->get(), 1); }))
    , m_epoll(epoll_create1(EPOLL_CLOEXEC))
    , m_spare(::open("/dev/null", O_RDONLY | O_CLOEXEC))
    , m_name(std::move(name))
    , m_lastTag(listenerTag) {
    m_canListen = watch(m_wake->get(), wakeTag) && watch(m_name->listener(), listenerTag);
}

UnixLocalPort::~UnixLocalPort() {
    close();
}

void UnixLocalPort::run(const Receiver& receiver) {
    PacketReader reader;
    std::vector<Arrival> group;
    std::array<epoll_event, 64> events;
    while (!m_closed) {
        const int count = epoll_wait(m_epoll.get(), events.data(), static_cast<int>(events.size()),
                                     m_rests ? restMilliseconds : -1);
        if (count < 0 && errno != EINTR) return;
        if (m_rests) listenAgain();
        for (const auto& event : std::span(events).first(static_cast<std::size_t>(std::max(count, 0)))) {
            if (event.data.u64 == wakeTag)
                resumePaused();
            else if (event.data.u64 == listenerTag)
                accept();
            else
                read(event.data.u64, reader, group);
            if (!group.empty()) receiver(group);
            group.clear();
        }
    }
}

void UnixLocalPort::close() {
    const std::lock_guard lock(m_mutex);
    m_closed = true;
    m_name.reset();
    for (const auto& connection : m_connections)
        connection.second->close();
    m_tap.counters.connections -= m_connections.size();
    m_connections.clear();
    eventfd_write(m_wake->get(), 1);
}

bool UnixLocalPort::watch(int descriptor, std::uint64_t tag) {
    epoll_event event = {};
    event.events = EPOLLIN;
    event.data.u64 = tag;
    return epoll_ctl(m_epoll.get(), EPOLL_CTL_ADD, descriptor, &event) == 0;
}

void UnixLocalPort::accept() {
    const std::lock_guard lock(m_mutex);
    if (!m_name) return;
    Descriptor socket(accept4(m_name->listener(), nullptr, nullptr, SOCK_CLOEXEC | SOCK_NONBLOCK));
    const int error = socket ? 0 : errno;
    if ((error == EMFILE || error == ENFILE) && refuseOne()) return;
    if (error == EAGAIN || error == EINTR) return;
    if (error != 0) return rest(error);
    m_rests = false;

    ucred sender = {};
    socklen_t size = sizeof sender;
    getsockopt(socket.get(), SOL_SOCKET, SO_PEERCRED, &sender, &size);
    if (sender.uid != m_user) return complain(sender.pid, "another user's");
    const auto isOfSender = [&](const auto& entry) { return entry.second->peer().processID == sender.pid; };
    if (std::ranges::count_if(m_connections, isOfSender) >= connectionsOfSender ||
        m_connections.size() >= connectionsOfAll)
        return complain(sender.pid, "too many");
    const PortPeer peer{sender.pid, SerialNumberOfPeer(sender.pid)};
    const auto tag = ++m_lastTag;
    if (!watch(socket.get(), tag)) return complain(sender.pid, "the system has no room to wait for it");
    m_connections.emplace(tag, std::make_shared<IncomingConnection>(std::move(socket), peer, m_backlog));
    ++m_tap.counters.connections;
}

bool UnixLocalPort::refuseOne() {
    m_spare.reset();
    const bool isRefused(Descriptor(accept4(m_name->listener(), nullptr, nullptr, SOCK_CLOEXEC)));
    if (isRefused) complain(0, "no descriptor left"); // before the last is taken again: the log needs it
    m_spare.reset(::open("/dev/null", O_RDONLY | O_CLOEXEC));
    return isRefused;
}

/// The connection that cannot be taken still waits, and the listener would be readable at every turn.
void UnixLocalPort::rest(int error) {
    epoll_ctl(m_epoll.get(), EPOLL_CTL_DEL, m_name->listener(), nullptr);
    if (std::exchange(m_rests, true)) return;
    Log("IPC: %s: unable to take connections for now: %s\n", m_label.c_str(), std::strerror(error));
}

void UnixLocalPort::listenAgain() {
    const std::lock_guard lock(m_mutex);
    if (m_name) watch(m_name->listener(), listenerTag); // as it may be already
}

/// What is there now, and little enough for the others to have their turn soon.
void UnixLocalPort::read(std::uint64_t tag, PacketReader& reader, std::vector<Arrival>& group) {
    const std::lock_guard lock(m_mutex);
    const auto found = m_connections.find(tag);
    if (found == m_connections.end()) return;
    const auto connection = found->second;
    bool isOver = false, isWaitedFor = false;
    // Whoever waits for an answer has sent nothing after it.
    while (group.size() < largestGroup && !isWaitedFor) {
        if (!m_backlog->admits(connection->peer().processID)) {
            pause(tag);
            break;
        }
        if (!readPacket(*connection, reader, isOver)) break;
        for (auto& message : reader.packet().messages) {
            isWaitedFor |= message.header.wantsAnAnswer();
            take(connection, message, group);
        }
    }
    if (isOver) remove(tag);
}

bool UnixLocalPort::readPacket(const IncomingConnection& connection, PacketReader& reader, bool& isOver) {
    const auto reading = reader.read(connection.socket());
    const auto& packet = reader.packet();
    const bool isOwn = packet.sender.uid == m_user && packet.sender.pid == connection.peer().processID;
    if (reading == Reading::packet && isOwn) return true;
    isOver = reading != Reading::nothing;
    const auto* const fault = reading == Reading::packet ? "sent by another process" : packet.fault;
    reader.packet().messages.clear(); // and what they keep
    if (fault) complain(connection.peer().processID, fault);
    return false;
}

void UnixLocalPort::take(const std::shared_ptr<IncomingConnection>& connection, IncomingMessage& message,
                         std::vector<Arrival>& group) {
    if (message.header.isTap()) return m_tap.add(connection, message.header.sequence);
    m_tap.didReceive(message.header, message.payload, connection->peer().processID);
    group.push_back({std::move(message.payload), connection->peer(), connection->receipt(message.header),
                     std::move(message.peek)});
}

void UnixLocalPort::pause(std::uint64_t tag) {
    // Asking for no events looks enough, and still wakes us at every turn once the sender has hung up.
    epoll_ctl(m_epoll.get(), EPOLL_CTL_DEL, m_connections.at(tag)->socket(), nullptr);
    m_paused.push_back(tag);
}

void UnixLocalPort::resumePaused() {
    eventfd_t ignored = 0;
    eventfd_read(m_wake->get(), &ignored);
    const std::lock_guard lock(m_mutex);
    std::erase_if(m_paused, [this](std::uint64_t tag) {
        const auto found = m_connections.find(tag);
        if (found == m_connections.end()) return true;
        if (!m_backlog->admits(found->second->peer().processID)) return false;
        return watch(found->second->socket(), tag);
    });
}

void UnixLocalPort::remove(std::uint64_t tag) {
    const auto found = m_connections.find(tag);
    // The socket may stay open for its receipts; it would be readable at every turn.
    epoll_ctl(m_epoll.get(), EPOLL_CTL_DEL, found->second->socket(), nullptr);
    found->second->close();
    m_connections.erase(found);
    --m_tap.counters.connections;
}

void UnixLocalPort::complain(int processID, const char* fault) {
    if (!m_ports.mayLogAbout(std::to_string(processID))) return;
    Log("IPC: %s: closing the connection of process %d: %s\n", m_label.c_str(), processID, fault);
}

} // namespace platform
