#pragma once

#include <chrono>
#include <mutex>
#include <string>
#include <unordered_map>

/// Keeps a peer that sends rubbish, or takes nothing, from filling the log: ten entries a minute for each.
/// Any thread.
class LogLimit {
public:
    using Instant = std::chrono::steady_clock::time_point;

    /// Whether one more entry about that peer may be written; counts it if so.
    bool allows(const std::string& peer, Instant now);

private:
    struct Window {
        Instant start;
        int entries = 0;
    };
    std::mutex m_mutex; ///< guards what follows
    std::unordered_map<std::string, Window> m_windows;
};
