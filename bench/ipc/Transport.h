#pragma once

#include "lib/plist/Value.h"

#include <atomic>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <vector>

/// What every way of carrying a message from one process to the main thread of another is measured by.

/// One message, for those that write property lists and for those that carry bytes alone.
struct Payload {
    plist::Value userInfo;
    std::vector<std::byte> bytes; ///< the envelope as it travels
};

/// What sender and receiver share. The receiver marks it, so that nothing has to travel back.
struct Board {
    std::atomic<std::uint64_t> ready = 0; ///< receivers
    std::atomic<std::uint64_t> handled = 0;
    std::atomic<std::int64_t> handledAt = 0; ///< on the steady clock, of the last one
    std::atomic<std::uint64_t> touched = 0;

    static std::int64_t now() { return std::chrono::steady_clock::now().time_since_epoch().count(); }
    void mark() {
        handledAt = now();
        ++handled;
    }
    /// The first and the last byte, so that what is handled is really there.
    void touch(std::span<const std::byte> bytes) {
        if (bytes.empty()) return;
        touched =
            touched + std::to_integer<unsigned>(bytes.front()) + std::to_integer<unsigned>(bytes.back());
    }
};

class Transport {
public:
    virtual ~Transport() = default;
    /// In the receiver: calls `board.touch` and `board.mark` on this thread for each message, until the
    /// process is killed. Says `++board.ready` once it can be reached.
    virtual void serve(Board& board) = 0;
    /// In the sender, once, when the receiver is ready.
    virtual void connect() = 0;
    /// Returns once the message was handled, or, without `wait`, once it was taken.
    virtual void send(const Payload& payload, bool wait) = 0;
};

/// `place` is a directory of the run's own, or the address of a bus.
using MakeTransport = std::unique_ptr<Transport> (*)(const std::string& place);
struct Rival {
    const char* name;
    MakeTransport make;
};
/// Those that were built.
std::vector<Rival>& Rivals();
struct Enrolled {
    Enrolled(const char* name, MakeTransport make) { Rivals().push_back({name, make}); }
};
