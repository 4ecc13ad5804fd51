#pragma once

#include "platform/MainLoop.h"

#include <functional>
#include <memory>
#include <string>

namespace platform {

/// Broadcasts by name, without payload, to every process of the user's session. Main thread only.
class DistributedNotificationCenter {
public:
    virtual ~DistributedNotificationCenter() = default;

    /// Reaches every observer in every process, this one's too, from its main loop. Equal notices that were
    /// not delivered yet may merge into one.
    virtual void post(const std::string& name) = 0;

    /// The same, for observers in this process alone.
    virtual void postLocally(const std::string& name) = 0;

    [[nodiscard]] virtual std::unique_ptr<Handle> observe(const std::string& name,
                                                          std::function<void()> handler) = 0;
};

} // namespace platform
