#pragma once

#include "bench/ipc/Payloads.h"
#include "bench/ipc/Transport.h"

#include <algorithm>
#include <csignal>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

using Times = std::vector<std::int64_t>; ///< nanoseconds

/// In microseconds.
inline double Quantile(Times times, double part) {
    const auto at = times.begin() + static_cast<std::ptrdiff_t>(part * static_cast<double>(times.size() - 1));
    std::ranges::nth_element(times, at);
    return static_cast<double>(*at) / 1000;
}
inline double Median(Times times) {
    return Quantile(std::move(times), 0.5);
}

template <class Work>
std::int64_t TimeOf(const Work& work) {
    const auto start = Board::now();
    work();
    return Board::now() - start;
}

inline void Rest(int microseconds) {
    usleep(static_cast<useconds_t>(microseconds));
}

inline Board& NewBoard() {
    return *new (mmap(nullptr, sizeof(Board), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0))
        Board;
}

/// A process that does its work until this one ends. Start it before there is any thread.
template <class Work>
pid_t StartProcess(const Work& work) {
    const auto started = fork();
    if (started != 0) return started;
    prctl(PR_SET_PDEATHSIG, SIGKILL);
    work();
    _exit(1);
}

/// A receiver in a process of its own, and the way to it.
class Pair {
public:
    explicit Pair(const Rival& rival, const std::string& place)
        : m_board(&NewBoard())
        , m_receiver(StartProcess([&] { rival.make(place)->serve(*m_board); })) {
        while (m_board->ready == 0)
            Rest(100);
        m_sender = rival.make(place);
        m_sender->connect();
        for (int i = 0; i < 3; ++i)
            m_sender->send(MenuRefresh(), true);
    }
    ~Pair() { kill(m_receiver, SIGKILL); }
    Pair(const Pair&) = delete;
    Pair& operator=(const Pair&) = delete;

    Transport& sender() { return *m_sender; }
    pid_t receiver() const { return m_receiver; }
    Board& board() { return *m_board; }
    void awaitHandled(std::uint64_t count) {
        while (m_board->handled < count) {
            if (waitpid(m_receiver, nullptr, WNOHANG) != 0) _exit(1);
            Rest(20);
        }
    }
    /// From the call until the receiver's main thread has it.
    std::int64_t timeToHandle(const Payload& payload) {
        const auto before = m_board->handled.load();
        const auto start = Board::now();
        m_sender->send(payload, false);
        awaitHandled(before + 1);
        return m_board->handledAt - start;
    }

private:
    Board* m_board;
    pid_t m_receiver;
    std::unique_ptr<Transport> m_sender;
};
