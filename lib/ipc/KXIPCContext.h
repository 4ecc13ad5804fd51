#pragma once

#include <cstdint>
#include <string>

namespace platform {
class MessagePorts;
class DistributedNotificationCenter;
class MainLoop;
class ProcessTable;
} // namespace platform

/// What one process needs to take part: the services it works on, who it is, and its message counter. One per
/// process, made by `main`; it must outlive every client, server and receiver made with it, and its services
/// must outlive it. What the ports still have to send is sent, for two seconds at most, when they end.
struct KXIPCContext {
    platform::MessagePorts& ports;
    platform::DistributedNotificationCenter& notifications;
    platform::MainLoop& mainLoop;
    platform::ProcessTable& processes;
    std::string mainBundleIdentifier;
    /// The number of the last message sent, to whomever. Main thread only.
    std::int32_t messageCounter = 0;
};
