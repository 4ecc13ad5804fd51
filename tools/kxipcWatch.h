#pragma once

#include "platform/Clock.h"
#include "platform/PortWatch.h"

#include <functional>
#include <iosfwd>
#include <string>

/// What to do with messages as they pass; seconds count from the start of the watch.
using KxipcMessageHandler = std::function<void(const platform::PassingMessage& message, double seconds)>;

/// Watches one port until its process ends.
class KxipcWatch final : private platform::PortWatchDelegate {
public:
    KxipcWatch(platform::PortWatches& watches, const platform::Clock& clock, KxipcMessageHandler onMessage,
               std::function<void()> onEnd);
    /// Prints the statistics to `output` when they come, and ends.
    KxipcWatch(platform::PortWatches& watches, const platform::Clock& clock, std::ostream& output,
               std::function<void()> onEnd);

    /// The exit status.
    int start(const std::string& port, std::ostream& errors);

private:
    void onStatistics(const SharedBytes& propertyList) override;
    void onMessage(const platform::PassingMessage& message) override;
    void onEnd() override { m_onEnd(); }

    platform::PortWatches& m_watches;
    const platform::Clock& m_clock;
    KxipcMessageHandler m_onMessage;
    std::ostream* m_statistics = nullptr;
    std::function<void()> m_onEnd;
    platform::Clock::Instant m_start;
    std::unique_ptr<platform::Handle> m_watch;
};

/// One line about a message, with its end: for people, or JSON.
std::string KxipcLine(const platform::PassingMessage& message, double seconds, bool json);
