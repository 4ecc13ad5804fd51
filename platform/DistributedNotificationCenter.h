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

    /// Reaches every observer in every process, this one's too, from its main loop, in the order of posting.
    /// Equal notices that were not delivered yet may merge into one; when too many wait, all observers are
    /// called. What cannot be posted is lost.
    virtual void post(const std::string& name) = 0;

    /// The same, for observers in this process alone.
    virtual void postLocally(const std::string& name) = 0;

    /// Calls `handler` for each notice of that name until the handle ends. The handle may outlive the centre.
    [[nodiscard]] virtual std::unique_ptr<Handle> observe(const std::string& name,
                                                          std::function<void()> handler) = 0;
};

} // namespace platform
