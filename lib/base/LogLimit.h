#pragma once

#include <chrono>
#include <unordered_map>

/// Keeps a peer that sends rubbish from filling the log: ten entries a minute for each process. For one
/// thread at a time.
class LogLimit {
public:
    using Instant = std::chrono::steady_clock::time_point;

    /// Whether one more entry about that process may be written; counts it if so.
    bool allows(int processID, Instant now);

private:
    struct Window {
        Instant start;
        int entries = 0;
    };
    std::unordered_map<int, Window> m_windows;
};
