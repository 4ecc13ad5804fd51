#include "lib/ipc/KXIPCCommon.h"

#include "lib/base/Log.h"
#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCMessage.h"
#include "lib/ipc/KXIPCObserverEntry.h"
#include "lib/kxAppKit/system/KXProcess.h"
#include "lib/plist/Value.h"
#include "platform/MessagePort.h"
#include "platform/ProcessTable.h"

#include <algorithm>
#include <any>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

KXIPCCommon::KXIPCCommon(KXIPCContext& context)
    : m_context(context)
    , m_messageReceiver(context, *this) {}

KXIPCCommon::~KXIPCCommon() = default;

void KXIPCCommon::setAllowIncomingMessages(bool allow) {
    if (allow)
        m_messageReceiver.startReceivingWithPortName(portName());
    else
        m_messageReceiver.stopReceiving();
}

KXIPCCommon::Observer* KXIPCCommon::find(const void* token) {
    const auto found = m_places.find(token);
    return found == m_places.end() ? nullptr : &m_observerTable[found->second];
}

KXIPCObserverEntry::Array& KXIPCCommon::Observer::changeableEntries() {
    if (entries.use_count() > 1) entries = std::make_shared<KXIPCObserverEntry::Array>(*entries);
    return *entries;
}

void KXIPCCommon::addEntries(const KXIPCObserverEntry::Array& entries, const void* observer) {
    auto* known = find(observer);
    if (!known) {
        m_places.emplace(observer, m_observerTable.size());
        known =
            &m_observerTable.emplace_back(Observer{observer, std::make_shared<KXIPCObserverEntry::Array>()});
    }
    auto& all = known->changeableEntries();
    all.insert(all.end(), entries.begin(), entries.end());
}

void KXIPCCommon::removeEntries(const KXIPCObserverEntry::Array& entries, const void* observer) {
    auto* known = find(observer);
    if (!known) return;
    // Removing each entry's matches at once would shift the indexes of the next; the empty list stays.
    auto& all = known->changeableEntries();
    std::vector<bool> removed(all.size());
    for (const auto& entry : entries)
        for (const auto index : entry->matchesInObserverArray(all))
            removed[index] = true;
    std::size_t index = 0;
    std::erase_if(all, [&](const auto&) { return removed[index++]; });
    ++m_removals;
}

KXIPCObserverEntry::Array KXIPCCommon::allEntries() const {
    KXIPCObserverEntry::Array all;
    for (const auto& observer : m_observerTable)
        all.insert(all.end(), observer.entries->begin(), observer.entries->end());
    return all;
}

std::uint64_t KXIPCCommon::processNumber() const {
    return KXNumberFromProcessSerialNumber(
        m_context.processes.currentProcess().value_or(ProcessSerialNumber{}));
}

void KXIPCCommon::postMessage(const KXIPCMessage& message, bool) {
    std::ignore = dispatchMessageToLocalListeners(message);
}

bool KXIPCCommon::dispatchMessageToLocalListeners(const KXIPCMessage& message) {
    // Those that come meanwhile are not asked; a table that was emptied has none left.
    const std::size_t count = m_observerTable.size();
    for (std::size_t i = 0; i < std::min(count, m_observerTable.size()); ++i)
        if (!dispatch(message, m_observerTable[i])) return false;
    return true;
}

/// Whether this object is still there afterwards.
bool KXIPCCommon::dispatch(const KXIPCMessage& message, const Observer& observer) {
    const auto* token = observer.token;
    const auto entries = observer.entries;
    const auto removalsBefore = m_removals;
    const auto isStillThere = [&](const KXIPCObserverEntry::Pointer& entry) {
        if (m_removals == removalsBefore) return true;
        const auto* now = find(token);
        return now && std::ranges::find(*now->entries, entry) != now->entries->end();
    };
    const std::weak_ptr alive = m_alive;
    for (const auto& entry : *entries) {
        if (!message.matches(*entry) || !entry->selector() || !isStillThere(entry)) continue;
        entry->selector()({*message.name(), message.object() ? std::any(*message.object()) : std::any(),
                           message.userInfo()});
        if (alive.expired()) return false;
    }
    return true;
}

void KXIPCCommon::onRemoteMessageReceived(const plist::Value& envelope) {
    if (!allowIncomingMessages()) return;
    const auto message = KXIPCMessage::initWithInfo(envelope["message"]);
    const auto sender = envelope["psnKey"].unsignedLongLongValue();
    const auto messageID = envelope["messageID"].intValue();
    if (m_lastMessageIDs.size() >= m_mostSenders) forgetEndedSenders();
    auto& lastMessageID = m_lastMessageIDs[sender];
    if (messageID > lastMessageID) {
        lastMessageID = messageID;
        std::ignore = dispatchMessageToLocalListeners(message);
        return;
    }
    if (m_context.ports.mayLogAbout(std::to_string(KXProcessSerialNumberFromNumber(sender).lowLongOfPSN)))
        Log("IPC: %s: dropping duplicate or out of order message\n",
            "-[KXIPCCommon onRemoteMessageReceived:]");
}

void KXIPCCommon::forgetEndedSenders() {
    std::erase_if(m_lastMessageIDs, [this](const auto& entry) {
        const auto process = KXProcessSerialNumberFromNumber(entry.first);
        return m_context.processes.serialNumberOf(static_cast<int>(process.lowLongOfPSN)) != process;
    });
    // Asking costs a few calls of the system for each: so it is done when there are twice as many.
    m_mostSenders = std::max(m_mostSenders, 2 * m_lastMessageIDs.size());
}

void KXIPCCommon::terminateWithDelegate(std::function<void()> selector) {
    m_terminateSelector = std::move(selector);
    m_observerTable.clear();
    m_places.clear();
    ++m_removals;
    // A port that could not be opened has had its end notice, and no other will come.
    const bool isNoticeToCome = m_messageReceiver.willTerminate();
    if (allowIncomingMessages()) setAllowIncomingMessages(false);
    if (!isNoticeToCome) onMessageReceiverDidTerminate();
}

void KXIPCCommon::onMessageReceiverDidTerminate() {
    // Moved out first: the selector may destroy this object.
    const auto selector = std::exchange(m_terminateSelector, nullptr);
    if (selector) selector();
}
