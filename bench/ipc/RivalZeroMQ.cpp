#include "bench/ipc/Transport.h"

#include <zmq.h>

namespace {

/// ZeroMQ over ipc: a pair, one way for messages and the other for answers.
class ZeroMQ final : public Transport {
public:
    explicit ZeroMQ(const std::string& directory)
        : m_address("ipc://" + directory + "/zmq") {
        const int noBound = 0;
        zmq_setsockopt(m_socket, ZMQ_SNDHWM, &noBound, sizeof noBound);
        zmq_setsockopt(m_socket, ZMQ_RCVHWM, &noBound, sizeof noBound);
    }

    void serve(Board& board) override {
        zmq_bind(m_socket, m_address.c_str());
        ++board.ready;
        for (;;) {
            char waits = 0;
            zmq_recv(m_socket, &waits, 1, 0);
            zmq_msg_t message;
            zmq_msg_init(&message);
            zmq_msg_recv(&message, m_socket, 0);
            board.touch({static_cast<const std::byte*>(zmq_msg_data(&message)), zmq_msg_size(&message)});
            board.mark();
            zmq_msg_close(&message);
            if (waits) zmq_send(m_socket, "", 0, 0);
        }
    }
    void connect() override { zmq_connect(m_socket, m_address.c_str()); }
    void send(const Payload& payload, bool wait) override {
        const char waits = wait;
        zmq_send(m_socket, &waits, 1, ZMQ_SNDMORE);
        zmq_send(m_socket, payload.bytes.data(), payload.bytes.size(), 0);
        char none;
        if (wait) zmq_recv(m_socket, &none, 1, 0);
    }

private:
    void* m_context = zmq_ctx_new();
    void* m_socket = zmq_socket(m_context, ZMQ_PAIR);
    const std::string m_address;
};

const Enrolled enrolled("ZeroMQ", [](const std::string& place) -> std::unique_ptr<Transport> {
    return std::make_unique<ZeroMQ>(place);
});

} // namespace
