#pragma once

#include "platform/MainLoop.h"

#include <compare>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>

namespace platform {

/// Identity of a process: stable while it runs, never given to another. Both words zero: no process.
struct ProcessSerialNumber {
    std::uint32_t highLongOfPSN = 0; ///< when it started
    std::uint32_t lowLongOfPSN = 0;  ///< process id
    friend auto operator<=>(const ProcessSerialNumber&, const ProcessSerialNumber&) = default;
};

struct ProcessInfo {
    ProcessSerialNumber serialNumber;
    std::string executablePath; ///< empty when it may not be read
    std::optional<std::string> bundleIdentifier;
    std::optional<std::string> bundlePath; ///< the desktop entry
    bool isUIElement = false;              ///< its entry wants no place in menus
    bool isBackgroundOnly = false;         ///< it is no application: nothing identifies it
};

/// The current user's processes. Main thread only, but for `currentProcess` and `serialNumberOf`: any thread.
class ProcessTable {
public:
    virtual ~ProcessTable() = default;

    virtual std::optional<ProcessSerialNumber> currentProcess() const = 0;

    /// The identity of a living process id.
    virtual std::optional<ProcessSerialNumber> serialNumberOf(int pid) const = 0;

    /// The next process by ascending id; after no process, the first; nothing after the last.
    virtual std::optional<ProcessInfo> nextProcess(ProcessSerialNumber after) const = 0;

    /// Nothing once the process has ended; a zombie has.
    virtual std::optional<ProcessInfo> info(ProcessSerialNumber process) const = 0;

    /// Asks the process to end; false when it has ended already or may not be asked.
    virtual bool terminate(ProcessSerialNumber process) = 0;

    /// Ends the process at once, whatever it is doing; false as above.
    virtual bool kill(ProcessSerialNumber process) = 0;

    /// Calls `handler` once from the main loop when the process ends. Null when it has ended already or
    /// cannot be watched.
    [[nodiscard]] virtual std::unique_ptr<Handle> watchExit(ProcessSerialNumber process,
                                                            std::function<void()> handler) = 0;
};

} // namespace platform
