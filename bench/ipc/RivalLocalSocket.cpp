#include "bench/ipc/Transport.h"

#include <QCoreApplication>
#include <QLocalServer>
#include <QLocalSocket>

namespace {

/// QLocalSocket on the event loop of the receiver's main thread.
class LocalSocket final : public Transport {
public:
    explicit LocalSocket(const std::string& directory)
        : m_path(QString::fromStdString(directory + "/local")) {}

    void serve(Board& board) override {
        QLocalServer server;
        server.listen(m_path);
        QObject::connect(&server, &QLocalServer::newConnection, &server, [&] {
            auto* socket = server.nextPendingConnection();
            QObject::connect(socket, &QLocalSocket::readyRead, socket,
                             [&board, socket] { take(board, *socket); });
        });
        ++board.ready;
        QCoreApplication::exec();
    }
    void connect() override {
        m_socket.connectToServer(m_path);
        m_socket.waitForConnected();
    }
    void send(const Payload& payload, bool wait) override {
        Header header{payload.bytes.size(), wait};
        m_socket.write(reinterpret_cast<const char*>(&header), sizeof header);
        m_socket.write(reinterpret_cast<const char*>(payload.bytes.data()),
                       static_cast<qint64>(payload.bytes.size()));
        m_socket.flush();
        while (m_socket.bytesToWrite() > 0)
            m_socket.waitForBytesWritten();
        if (!wait) return;
        while (m_socket.bytesAvailable() < qint64{sizeof header})
            m_socket.waitForReadyRead();
        m_socket.read(reinterpret_cast<char*>(&header), sizeof header);
    }

private:
    struct Header {
        std::uint64_t size;
        std::uint64_t waits;
    };
    static void take(Board& board, QLocalSocket& socket) {
        Header header{};
        while (socket.peek(reinterpret_cast<char*>(&header), sizeof header) == sizeof header &&
               socket.bytesAvailable() >= static_cast<qint64>(sizeof header + header.size)) {
            socket.skip(sizeof header);
            const auto bytes = socket.read(static_cast<qint64>(header.size));
            board.touch(std::as_bytes(std::span(bytes.data(), header.size)));
            board.mark();
            if (!header.waits) continue;
            socket.write(reinterpret_cast<const char*>(&header), sizeof header);
            socket.flush();
        }
    }

    int m_count = 0;
    QCoreApplication m_application{m_count, nullptr};
    const QString m_path;
    QLocalSocket m_socket;
};

const Enrolled enrolled("QLocalSocket", [](const std::string& place) -> std::unique_ptr<Transport> {
    return std::make_unique<LocalSocket>(place);
});

} // namespace
