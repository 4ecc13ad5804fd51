#include "tools/kxipcRecording.h"

#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCMessage.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCSend.h"
#include "lib/kxAppKit/system/KXProcess.h"
#include "lib/plist/Binary.h"
#include "lib/plist/Value.h"
#include "platform/MainLoop.h"
#include "platform/MessagePort.h"
#include "platform/PortWatch.h"

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <ios>
#include <istream>
#include <optional>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

namespace {

constexpr std::uint64_t longestEntry = plist::Limits().bytes;

void write(std::ostream& file, const plist::Value& entry) {
    std::string error;
    // A message of the largest size is too large with what is noted of it: it is left out.
    const auto written = plist::WriteBinary(entry, error);
    if (written.pieces.empty()) return;
    for (std::uint64_t length = written.size, i = 0; i < sizeof length; ++i)
        file.put(static_cast<char>(length >> (8 * i) & 0xFF));
    for (const auto piece : written.pieces)
        file.write(reinterpret_cast<const char*>(piece.data()), static_cast<std::streamsize>(piece.size()));
    file.flush();
}

/// Nil at the end, and for what cannot be read.
plist::Value read(std::istream& file) {
    unsigned char digits[8] = {};
    if (!file.read(reinterpret_cast<char*>(digits), sizeof digits)) return {};
    std::uint64_t length = 0;
    for (int i = 7; i >= 0; --i)
        length = length << 8 | digits[i];
    if (length > longestEntry) return {};
    std::string bytes(length, '\0');
    if (!file.read(bytes.data(), static_cast<std::streamsize>(length))) return {};
    std::string error;
    return plist::ParseBinary(plist::Data::copyOf(bytes.data(), bytes.size()), error);
}

/// The user information with another sender in it, where it names one.
plist::Value claimedBy(const plist::Value& userInfo, std::uint64_t number) {
    if (userInfo[KX_IPC_PARAM_PSN].isNil()) return userInfo;
    std::vector<plist::Dictionary::Entry> entries;
    for (std::size_t i = 0; i < userInfo.size(); ++i)
        entries.emplace_back(userInfo.keyAt(i), userInfo.at(i));
    return plist::Dictionary(std::move(entries)).set(KX_IPC_PARAM_PSN, number);
}

} // namespace

void KxipcStartRecording(std::ostream& file, const std::string& port) {
    write(file, plist::Dictionary{{"port", port}});
}

void KxipcRecord(std::ostream& file, const platform::PassingMessage& message, double seconds) {
    write(file, plist::Dictionary{{"seconds", seconds},
                                  {"outgoing", message.outgoing},
                                  {"process", message.processID},
                                  {"missed", message.missed},
                                  {"payload", message.bytes}});
}

std::optional<std::vector<KxipcRecordedMessage>> KxipcReadRecording(std::istream& file, bool toServer) {
    const auto start = read(file);
    if (!start["port"].isString()) return std::nullopt;
    const bool isServers = start["port"].equalsString(KX_IPC_ServerPortName());
    std::vector<KxipcRecordedMessage> messages;
    for (auto entry = read(file); !entry.isNil(); entry = read(file)) {
        if ((isServers != entry["outgoing"].boolValue()) != toServer) continue;
        std::string error;
        const auto envelope = plist::Parse(entry["payload"].data(), error);
        if (!envelope["message"].isDictionary()) continue;
        messages.push_back({entry["seconds"].doubleValue(), KXIPCMessage::initWithInfo(envelope["message"]),
                            envelope["synchronous"].boolValue()});
    }
    return messages;
}

KxipcReplay::KxipcReplay(KXIPCContext& context, std::vector<KxipcRecordedMessage> messages, std::string port,
                         std::function<void()> onEnd)
    : m_context(context)
    , m_messages(std::move(messages))
    , m_port(std::move(port))
    , m_onEnd(std::move(onEnd)) {}

void KxipcReplay::start(double speed) {
    m_speed = speed;
    sendAfter({});
}

void KxipcReplay::sendAfter(platform::MainLoop::Milliseconds pause) {
    m_timer = m_context.mainLoop.startTimer(pause, {}, [this] { sendNext(); });
}

void KxipcReplay::sendNext() {
    if (m_context.ports.queued().waiting > 0) return sendAfter(std::chrono::milliseconds(1));
    if (m_next == m_messages.size()) return m_onEnd();
    const auto& [seconds, message, synchronous] = m_messages[m_next];
    const auto self = m_context.processes.currentProcess().value_or(ProcessSerialNumber{});
    const auto userInfo = claimedBy(message.userInfo(), KXNumberFromProcessSerialNumber(self));
    KX_IPC_SendMessageToNamedPort(m_context, {message.name(), message.object(), userInfo}, m_port,
                                  synchronous);
    ++m_next;
    double pause = 0;
    if (m_speed > 0 && m_next < m_messages.size()) pause = (m_messages[m_next].seconds - seconds) / m_speed;
    // A recording may claim any times, what is no number too; none is waited for longer than a day.
    const auto milliseconds = static_cast<std::int64_t>(pause > 0 ? std::min(pause, 86'400.0) * 1000 : 0);
    sendAfter(std::chrono::milliseconds(milliseconds));
}
