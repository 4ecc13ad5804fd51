#include "bench/ipc/Socket.h"
#include "bench/ipc/Transport.h"

#include <sys/uio.h>
#include <unistd.h>

namespace {

/// A stream socket that the receiver's main thread reads itself.
class Stream final : public Transport {
public:
    explicit Stream(const std::string& directory)
        : m_path(directory + "/stream") {}

    void serve(Board& board) override {
        const int listener = UnixSocket(SOCK_STREAM, m_path, true);
        ++board.ready;
        const int socket = accept(listener, nullptr, nullptr);
        Header header;
        while (recv(socket, &header, sizeof header, MSG_WAITALL) == sizeof header) {
            // Room of its own for each: an icon outlives the handling.
            const auto bytes = std::make_unique_for_overwrite<std::byte[]>(header.size);
            recv(socket, bytes.get(), header.size, MSG_WAITALL);
            board.touch({bytes.get(), header.size});
            board.mark();
            if (header.waits) ::send(socket, &header, sizeof header, 0);
        }
    }
    void connect() override { m_socket = UnixSocket(SOCK_STREAM, m_path, false); }
    void send(const Payload& payload, bool wait) override {
        Header header{payload.bytes.size(), wait};
        const iovec vectors[2] = {{&header, sizeof header},
                                  {const_cast<std::byte*>(payload.bytes.data()), payload.bytes.size()}};
        auto written = static_cast<std::size_t>(writev(m_socket, vectors, 2)) - sizeof header;
        while (written < payload.bytes.size())
            written += static_cast<std::size_t>(
                write(m_socket, payload.bytes.data() + written, payload.bytes.size() - written));
        if (wait) recv(m_socket, &header, sizeof header, MSG_WAITALL);
    }

private:
    struct Header {
        std::uint64_t size;
        std::uint64_t waits;
    };
    const std::string m_path;
    int m_socket = -1;
};

const Enrolled enrolled("stream", [](const std::string& place) -> std::unique_ptr<Transport> {
    return std::make_unique<Stream>(place);
});

} // namespace
