#include "bench/ipc/Transport.h"

#include <nng/nng.h>
#include <nng/protocol/pair0/pair.h>

namespace {

/// nng over ipc, likewise a pair. Its last byte says whether an answer is waited for.
class Nng final : public Transport {
public:
    explicit Nng(const std::string& directory)
        : m_address("ipc://" + directory + "/nng") {
        nng_pair0_open(&m_socket);
        nng_socket_set_size(m_socket, NNG_OPT_RECVMAXSZ, 0);
        nng_socket_set_int(m_socket, NNG_OPT_SENDBUF, 1024);
        nng_socket_set_int(m_socket, NNG_OPT_RECVBUF, 1024);
    }

    void serve(Board& board) override {
        nng_listen(m_socket, m_address.c_str(), nullptr, 0);
        ++board.ready;
        for (;;) {
            nng_msg* message = nullptr;
            if (nng_recvmsg(m_socket, &message, 0) != 0) return;
            const std::span<const std::byte> bytes{static_cast<const std::byte*>(nng_msg_body(message)),
                                                   nng_msg_len(message)};
            const bool waits = bytes.back() != std::byte{0};
            board.touch(bytes);
            board.mark();
            nng_msg_free(message);
            char none = 0;
            if (waits) nng_send(m_socket, &none, 1, 0);
        }
    }
    void connect() override { nng_dial(m_socket, m_address.c_str(), nullptr, 0); }
    void send(const Payload& payload, bool wait) override {
        nng_msg* message = nullptr;
        nng_msg_alloc(&message, 0);
        nng_msg_append(message, payload.bytes.data(), payload.bytes.size());
        const char waits = wait;
        nng_msg_append(message, &waits, 1);
        nng_sendmsg(m_socket, message, 0);
        char none;
        std::size_t size = 1;
        if (wait) nng_recv(m_socket, &none, &size, 0);
    }

private:
    nng_socket m_socket{};
    const std::string m_address;
};

const Enrolled enrolled("nng", [](const std::string& place) -> std::unique_ptr<Transport> {
    return std::make_unique<Nng>(place);
});

} // namespace
