#include "platform/linux/Backlog.h"

#include <cstddef>
#include <mutex>
#include <utility>

namespace platform {

void Backlog::Load::add(std::size_t size) {
    ++messages;
    bytes += size;
}

void Backlog::Load::remove(std::size_t size) {
    --messages;
    bytes -= size;
}

bool Backlog::Load::isWithin(const Bounds& bounds) const {
    return messages < bounds.messages && bytes < bounds.bytes;
}

/// Whether to call for more. Not before half is free, or every message would wake the reader.
bool Backlog::Load::takeRoom(const Bounds& bounds) {
    return refused && isWithin({bounds.messages / 2, bounds.bytes / 2}) && std::exchange(refused, false);
}

bool Backlog::admits(int sender) {
    const std::lock_guard lock(m_mutex);
    const auto found = m_senders.find(sender);
    if (found == m_senders.end()) return true;
    const bool isFull = !m_all.isWithin(ofAll);
    const bool isRefused = isFull || !found->second.isWithin(ofSender);
    m_all.refused |= isFull;
    // Letting in one of the sender's connections looks like the end of it, and another may still wait for the
    // call.
    found->second.refused |= isRefused;
    return !isRefused;
}

void Backlog::add(int sender, std::size_t bytes) {
    const std::lock_guard lock(m_mutex);
    m_senders[sender].add(bytes);
    m_all.add(bytes);
}

void Backlog::remove(int sender, std::size_t bytes) {
    bool isRoom = false;
    {
        const std::lock_guard lock(m_mutex);
        const auto found = m_senders.find(sender);
        found->second.remove(bytes);
        m_all.remove(bytes);
        const bool isRoomForSender = found->second.takeRoom(ofSender); // both are asked, whatever they say
        isRoom = m_all.takeRoom(ofAll) || isRoomForSender;
        if (found->second.messages == 0) m_senders.erase(found);
    }
    if (isRoom) m_onRoom();
}

} // namespace platform
