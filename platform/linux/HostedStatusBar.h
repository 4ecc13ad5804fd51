#pragma once

#include "platform/StatusBar.h"

#include <cstdint>
#include <functional>
#include <utility>

namespace platform {

/// A status bar that another program, its host, provides. Hosts come and go; an item is good for the host
/// that it was added under, and shows nowhere once that has gone.
class HostedStatusBar : public StatusBar {
public:
    /// Another number for every host that appears; 0 while there is none that takes items.
    std::uint64_t host() const { return m_host; }
    /// Called after each change of `host`. May end and add items.
    void setHostChanged(std::function<void()> hostChanged) { m_hostChanged = std::move(hostChanged); }

    float thickness() const override { return 22; }

protected:
    void hostAppeared() { tell(++m_hostsSeen); }
    void hostWent() {
        if (m_host != 0) tell(0);
    }

private:
    void tell(std::uint64_t host) {
        m_host = host;
        if (m_hostChanged) m_hostChanged();
    }

    std::uint64_t m_host = 0;
    std::uint64_t m_hostsSeen = 0;
    std::function<void()> m_hostChanged;
};

} // namespace platform
