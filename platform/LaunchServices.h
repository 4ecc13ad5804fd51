#pragma once

#include "platform/Status.h"

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace platform {

inline constexpr std::uint32_t launchDontSwitch = 0x200; ///< the application is not to come to the front
inline constexpr std::uint32_t launchAsync = 0x10000;    ///< not to wait for what takes long

struct LaunchRequest {
    std::string applicationPath; ///< a desktop entry or an executable; empty for what opens the documents
    std::vector<std::string> documentURLs;
    std::uint32_t flags = 0;
    std::string properties; ///< the value of KX_LAUNCH_PROPERTIES; empty for none
};

struct LaunchOutcome {
    Status status = status::success;
    std::string reason;          ///< why not, for people
    std::string applicationPath; ///< of what was started
    int pid = 0;                 ///< 0 when the bus has started it
};

/// What is known of an application.
struct ApplicationRecord {
    std::optional<std::string> bundleIdentifier; ///< none for an executable
    std::string name;
    std::string executable; ///< a path, or a name to be looked for
    std::string icon;
    std::vector<std::string> urlSchemes;
    bool isUIElement = false; ///< wants no place in menus
};

/// Starting applications, and who opens what. Types of content are names that only this interface
/// understands; bundle identifiers are those of the process table. Main thread only.
class LaunchServices {
public:
    using LaunchHandler = std::function<void(const LaunchOutcome&)>;

    virtual ~LaunchServices() = default;

    /// Starts an application, a child of nobody. `done` is called once, as soon as it has started or failed
    /// to: before this returns, but for an asynchronous start over the bus, which the main loop tells of.
    virtual void open(const LaunchRequest& request, LaunchHandler done) = 0;

    /// Opens the desktop's settings at a page, which the desktop names. Why not, or nothing.
    virtual std::optional<std::string> openSettings(const std::string& pane) = 0;

    // The type of what a URL leads to, be it a file or another place. Empty when it is not known.
    virtual std::string typeOfScheme(const std::string& scheme) const = 0;
    virtual std::string typeOfExtension(const std::string& extension) const = 0; ///< without the dot
    virtual std::string typeOfURL(const std::string& url) const = 0;

    virtual std::optional<std::string> defaultApplication(const std::string& type) const = 0;
    /// All, the default first.
    virtual std::vector<std::string> applications(const std::string& type) const = 0;
    virtual Status setDefaultApplication(const std::string& type, const std::string& bundleIdentifier) = 0;

    /// Nothing when the file there is no application.
    virtual std::optional<ApplicationRecord> applicationAtURL(const std::string& url) const = 0;
};

} // namespace platform
