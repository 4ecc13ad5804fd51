#include "bench/ipc/Socket.h"
#include "bench/ipc/Transport.h"

#include <deque>
#include <fcntl.h>
#include <mutex>
#include <sys/eventfd.h>
#include <sys/mman.h>
#include <sys/uio.h>
#include <thread>
#include <unistd.h>

namespace {

/// The floor of our design: packets and sealed memory, read by a worker, handed over to the main thread, and
/// nothing else: nothing is parsed, checked or bounded, and bytes are what they are.
class Floor final : public Transport {
public:
    explicit Floor(const std::string& directory)
        : m_path(directory + "/floor") {}

    void serve(Board& board) override {
        const int listener = UnixSocket(SOCK_SEQPACKET, m_path, true);
        ++board.ready;
        m_socket = accept(listener, nullptr, nullptr);
        std::thread worker([this] { receive(); });
        for (;;) {
            eventfd_t count = 0;
            eventfd_read(m_wake, &count);
            std::deque<Arrival> arrivals;
            {
                const std::lock_guard lock(m_mutex);
                arrivals.swap(m_arrivals);
            }
            for (const auto& arrival : arrivals) {
                board.touch(arrival.bytes);
                board.mark();
                if (arrival.header.waits) ::send(m_socket, &arrival.header, sizeof arrival.header, 0);
            }
        }
    }
    void connect() override {
        m_socket = UnixSocket(SOCK_SEQPACKET, m_path, false);
        const int room = 2 * static_cast<int>(inlineLimit);
        setsockopt(m_socket, SOL_SOCKET, SO_SNDBUF, &room, sizeof room);
    }
    void send(const Payload& payload, bool wait) override {
        Header header{payload.bytes.size(), wait};
        iovec vectors[2] = {{&header, sizeof header},
                            {const_cast<std::byte*>(payload.bytes.data()), payload.bytes.size()}};
        msghdr message = {};
        message.msg_iov = vectors;
        message.msg_iovlen = 2;
        alignas(cmsghdr) char control[CMSG_SPACE(sizeof(int))] = {};
        int memory = -1;
        if (payload.bytes.size() > inlineLimit) {
            memory = memfd_create("floor", MFD_CLOEXEC | MFD_ALLOW_SEALING);
            if (writev(memory, vectors + 1, 1) < 0) return;
            fcntl(memory, F_ADD_SEALS, F_SEAL_SEAL | F_SEAL_SHRINK | F_SEAL_GROW | F_SEAL_WRITE);
            message.msg_iovlen = 1;
            message.msg_control = control;
            message.msg_controllen = sizeof control;
            auto* rights = CMSG_FIRSTHDR(&message);
            *rights = {CMSG_LEN(sizeof memory), SOL_SOCKET, SCM_RIGHTS};
            std::memcpy(CMSG_DATA(rights), &memory, sizeof memory);
        }
        sendmsg(m_socket, &message, 0);
        if (memory >= 0) close(memory);
        if (wait) recv(m_socket, &header, sizeof header, 0);
    }

private:
    static constexpr std::size_t inlineLimit = std::size_t{256} << 10;
    struct Header {
        std::uint64_t size;
        std::uint64_t waits;
    };
    struct Arrival {
        Header header;
        std::span<const std::byte> bytes;
        std::shared_ptr<const void> owner;
    };

    void receive() {
        std::vector<std::byte> room(inlineLimit);
        for (;;) {
            Arrival arrival;
            iovec vectors[2] = {{&arrival.header, sizeof arrival.header}, {room.data(), room.size()}};
            alignas(cmsghdr) char control[CMSG_SPACE(sizeof(int))];
            msghdr message = {};
            message.msg_iov = vectors;
            message.msg_iovlen = 2;
            message.msg_control = control;
            message.msg_controllen = sizeof control;
            if (recvmsg(m_socket, &message, 0) <= 0) return;
            const auto size = arrival.header.size;
            if (const auto* rights = CMSG_FIRSTHDR(&message)) {
                int memory = -1;
                std::memcpy(&memory, CMSG_DATA(rights), sizeof memory);
                void* mapping = mmap(nullptr, size, PROT_READ, MAP_PRIVATE, memory, 0);
                close(memory);
                arrival.owner = {mapping, [size](void* start) { munmap(start, size); }};
                arrival.bytes = {static_cast<const std::byte*>(mapping), size};
            } else {
                auto copy = std::make_shared_for_overwrite<std::byte[]>(size);
                std::memcpy(copy.get(), room.data(), size);
                arrival.bytes = {copy.get(), size};
                arrival.owner = std::move(copy);
            }
            {
                const std::lock_guard lock(m_mutex);
                m_arrivals.push_back(std::move(arrival));
            }
            eventfd_write(m_wake, 1);
        }
    }

    const std::string m_path;
    int m_socket = -1;
    const int m_wake = eventfd(0, EFD_CLOEXEC);
    std::mutex m_mutex;
    std::deque<Arrival> m_arrivals;
};

const Enrolled enrolled("floor", [](const std::string& place) -> std::unique_ptr<Transport> {
    return std::make_unique<Floor>(place);
});

} // namespace
