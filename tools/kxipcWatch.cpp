#include "tools/kxipcWatch.h"

#include "lib/plist/Binary.h"
#include "lib/plist/Value.h"
#include "platform/Clock.h"
#include "platform/PortWatch.h"
#include "tools/kxipcJson.h"

#include <chrono>
#include <cstdio>
#include <functional>
#include <ostream>
#include <string>
#include <utility>

namespace {

constexpr std::size_t longestContents = 240; // bytes of a line for people

/// What a message is, as far as it can be told.
plist::Dictionary describe(const platform::PassingMessage& message) {
    std::string error;
    const auto envelope = plist::Parse(message.bytes, error);
    const auto contents = envelope["message"];
    if (error.empty() && !contents.isDictionary()) error = "no envelope";
    if (!error.empty()) return {{"error", error}};
    return {{"messageID", envelope["messageID"]},
            {"name", contents["name"]},
            {"object", contents["object"]},
            {"userInfo", contents["userInfo"]}};
}

std::string jsonLine(const platform::PassingMessage& message, double seconds) {
    auto line = plist::Dictionary{{"seconds", seconds},
                                  {"direction", message.outgoing ? "out" : "in"},
                                  {"process", message.processID},
                                  {"bytes", message.bytes.size()},
                                  {"synchronous", message.synchronous},
                                  {"missed", message.missed}};
    const auto what = describe(message);
    for (const auto& [key, value] : what.entries())
        line.set(key, value);
    return KxipcJson(line) + '\n';
}

/// Nothing in it moves a terminal's cursor.
std::string plain(const plist::Value& text) {
    const auto quoted = KxipcJson(text);
    return text.isString() ? quoted.substr(1, quoted.size() - 2) : "(null)";
}

std::string lineForPeople(const platform::PassingMessage& message, double seconds) {
    const plist::Value what = describe(message);
    auto contents = what["userInfo"].isNil() ? std::string() : KxipcJson(what["userInfo"]);
    if (contents.size() > longestContents) contents = contents.substr(0, longestContents) + "...";
    char head[64];
    std::snprintf(head, sizeof head, "%10.3f %-3s %7d ", seconds, message.outgoing ? "out" : "in",
                  message.processID);
    std::string line;
    if (message.missed > 0) line = "(" + std::to_string(message.missed) + " messages missed)\n";
    const bool isMessage = what["error"].isNil();
    line += head + (isMessage ? plain(what["name"]) : "? " + plain(what["error"]));
    if (what["object"].isString()) line += " object " + plain(what["object"]);
    if (message.synchronous) line += " waits";
    line += ' ' + std::to_string(message.bytes.size()) + " bytes";
    return line + (contents.empty() ? "" : ' ' + contents) + '\n';
}

} // namespace

KxipcWatch::KxipcWatch(platform::PortWatches& watches, const platform::Clock& clock,
                       KxipcMessageHandler onMessage, std::function<void()> onEnd)
    : m_watches(watches)
    , m_clock(clock)
    , m_onMessage(std::move(onMessage))
    , m_onEnd(std::move(onEnd)) {}

KxipcWatch::KxipcWatch(platform::PortWatches& watches, const platform::Clock& clock, std::ostream& output,
                       std::function<void()> onEnd)
    : KxipcWatch(watches, clock, nullptr, std::move(onEnd)) {
    m_statistics = &output;
}

int KxipcWatch::start(const std::string& port, std::ostream& errors) {
    m_start = m_clock.now();
    m_watch = m_watches.watch(port, *this);
    if (m_watch) return 0;
    errors << "kxipc: nobody listens on " << port << '\n';
    return 1;
}

void KxipcWatch::onStatistics(const SharedBytes& propertyList) {
    if (!m_statistics) return;
    std::string error;
    const auto statistics = plist::Parse(propertyList, error);
    for (std::size_t i = 0; i < statistics.size(); ++i)
        *m_statistics << statistics.keyAt(i) << ' ' << KxipcJson(statistics.at(i)) << '\n';
    m_onEnd();
}

void KxipcWatch::onMessage(const platform::PassingMessage& message) {
    const std::chrono::duration<double> seconds = m_clock.now() - m_start;
    if (m_onMessage) m_onMessage(message, seconds.count());
}

std::string KxipcLine(const platform::PassingMessage& message, double seconds, bool json) {
    return json ? jsonLine(message, seconds) : lineForPeople(message, seconds);
}
