#pragma once

#include "platform/linux/DesktopEntryIndex.h"
#include "platform/linux/ProcDirectory.h"

#include <optional>
#include <string>
#include <vector>

namespace platform {

struct Application {
    std::string id;
    std::optional<std::string> entryPath;
    bool noDisplay = false;
};

/// What tells which application a process is. Stays as it is while the process runs one program, but for the
/// first moments, when who starts an application moves it into its unit; and but for the end of its parent,
/// where that is in the same unit.
struct ProcessEvidence {
    std::string executable;
    std::string prefixDirectory; ///< "share/applications" of the executable's own prefix
    std::optional<std::string> sandboxID;
    std::optional<std::string> unitID;
    bool hasParentInUnit = false;
};

/// Tells which application a process is, by the first of: what its sandbox says it is; the desktop entry for
/// its executable in the prefix directory; for the top process of an application's systemd unit, that unit's
/// id; the desktop entry for its executable in the data directories.
class ApplicationIdentifier {
public:
    /// `dataDirectories` hold "applications"; the first that has an entry wins.
    ApplicationIdentifier(const ProcDirectory& processes, const Clock& clock,
                          const std::vector<std::string>& dataDirectories,
                          std::vector<std::string> programDirectories);

    ProcessEvidence evidenceOf(int pid, int parent) const;
    /// By the entries as they are now.
    std::optional<Application> applicationOf(const ProcessEvidence& evidence);

private:
    std::optional<Application> inDirectory(const std::string& applicationsDirectory,
                                           const std::string& executable);
    std::optional<std::string> sandboxedID(int pid) const;
    Application applicationWithID(const std::string& id);

    const ProcDirectory& m_processes;
    std::vector<std::string> m_applicationsDirectories;
    DesktopEntryIndex m_entries;
};

} // namespace platform
