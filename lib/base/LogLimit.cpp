#include "lib/base/LogLimit.h"

#include <chrono>
#include <cstddef>
#include <mutex>
#include <string>
#include <vector>

namespace {
constexpr int entriesPerWindow = 10;
constexpr auto windowLength = std::chrono::minutes(1);
constexpr std::size_t windowsKept = 1024;
} // namespace

bool LogLimit::allows(const std::string& peer, Instant now) {
    const auto hasPassed = [now](const auto& item) { return now - item.second.start >= windowLength; };
    const std::lock_guard lock(m_mutex);
    if (m_windows.size() >= windowsKept) std::erase_if(m_windows, hasPassed);
    const auto found = m_windows.try_emplace(peer, Window{now}).first;
    if (hasPassed(*found)) found->second = {now};
    return found->second.entries < entriesPerWindow && ++found->second.entries > 0;
}
