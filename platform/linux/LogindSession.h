#pragma once

#include "platform/Session.h"

#include <string>
#include <utility>

namespace platform {

/// What the login manager says over the system bus, asked afresh each time, for a second at most. A process
/// of the user's service manager belongs to the session on the user's screen.
class LogindSession final : public Session {
public:
    /// Of the bus; empty for the system's.
    explicit LogindSession(std::string busAddress = {})
        : m_busAddress(std::move(busAddress)) {}

    std::optional<bool> isActive() const override;

private:
    std::string m_busAddress;
};

} // namespace platform
