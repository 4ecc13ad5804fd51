#pragma once

#include "lib/plist/Value.h"
#include "platform/ProcessTable.h"
#include "platform/Workspace.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

using ProcessSerialNumber = platform::ProcessSerialNumber;

/// The form in which serial numbers travel: the high word in the upper 32 bits.
std::uint64_t KXNumberFromProcessSerialNumber(ProcessSerialNumber process);
ProcessSerialNumber KXProcessSerialNumberFromNumber(std::uint64_t number);

class KXProcessEnumerator;

/// A handle on a process, which it can outlive. Main thread only; the table must outlive it.
class KXProcess : public std::enable_shared_from_this<KXProcess> {
public:
    using Pointer = std::shared_ptr<KXProcess>;

    static Pointer processWithSerialNumber(platform::ProcessTable& table, ProcessSerialNumber process);
    /// The first by process id, or null.
    static Pointer processWithBundleIdentifier(platform::ProcessTable& table, std::string_view bundleID);
    /// The first whose `url` is that, or null.
    static Pointer processWithURL(platform::ProcessTable& table, const std::string& url);
    /// This process, made anew only when it has changed; null when it cannot be read.
    static Pointer currentProcess(platform::ProcessTable& table);
    /// The one whose window has the keyboard, or null.
    static Pointer activeProcess(platform::ProcessTable& table, const platform::Workspace& workspace);
    static KXProcessEnumerator processEnumerator(platform::ProcessTable& table);

    ProcessSerialNumber processSerialNumber() const { return m_psn; }
    /// As it was when the handle was made.
    const std::optional<std::string>& bundleIdentifier() const { return m_bundleID; }
    int pid() const; ///< 0 once it has ended
    /// What is known of it: "pid", "CFBundleExecutable", "CFBundleIdentifier", "BundlePath" (the desktop
    /// entry, or without one the executable), "LSUIElement", "LSBackgroundOnly". Nil once it has ended.
    plist::Value info() const;
    bool isValid() const;
    std::optional<std::string> url() const; ///< of its "BundlePath"
    bool hasUI() const;
    bool isEqual(const KXProcess* other) const;
    bool isActiveApplication(const platform::Workspace& workspace) const;
    /// Brings all its windows forward, and gives the keyboard to the front one. Logs when that cannot be.
    void activate(const platform::Workspace& workspace) const;
    /// Only the front one.
    void activateForFrontWindow(const platform::Workspace& workspace) const;
    bool kill(); ///< at once, without asking it; false when it has ended already or is not ours to end

    using DeathHandler = std::function<void(KXProcess&)>;
    /// Calls `handler` once when the process ends, in the order of adding; ignored and logged when it has
    /// ended already. `owner` is the token for removal, never dereferenced: remove it before what the handler
    /// uses goes away. Observers may be removed, and the handle let go of, while being called; one that was
    /// removed is not.
    void addObserverForProcessDeath(const void* owner, DeathHandler handler);
    void removeObserverForProcessDeath(const void* owner);

    KXProcess(platform::ProcessTable& table, ProcessSerialNumber process,
              std::optional<std::string> bundleIdentifier);
    KXProcess(const KXProcess&) = delete;
    KXProcess& operator=(const KXProcess&) = delete;
    ~KXProcess();

private:
    struct DeathObserver {
        const void* owner;
        DeathHandler handler;
        bool removed = false;
    };

    void bringToFront(const platform::Workspace& workspace, platform::ProcessWindows windows,
                      const char* method) const;
    bool registerForProcessDeathNotification();
    void onProcessDeath();

    platform::ProcessTable& m_table;
    ProcessSerialNumber m_psn;
    std::optional<std::string> m_bundleID;
    std::unique_ptr<platform::Handle>
        m_processDeathWatch; ///< none before the first observer and after the death
    std::vector<std::shared_ptr<DeathObserver>> m_processDeathObservers;
};

/// Walks the processes by ascending id.
class KXProcessEnumerator {
public:
    explicit KXProcessEnumerator(platform::ProcessTable& table)
        : m_table(table) {}
    KXProcess::Pointer nextObject(); ///< null at the end

private:
    platform::ProcessTable& m_table;
    ProcessSerialNumber m_currentPSN;
};
