#pragma once

#include "platform/Clock.h"

#include <filesystem>
#include <map>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

namespace platform {

/// The desktop entries of directories, read once for each state of a directory. Entries in folders below are
/// not looked at.
class DesktopEntryIndex {
public:
    struct Entry {
        std::string id; ///< file name without ".desktop"
        std::string path;
        std::string executable; ///< without links; empty when there is none
        bool noDisplay = false;
    };

    /// Programs that an entry names without a path are looked for in "bin" of the entry's own prefix, then
    /// here.
    DesktopEntryIndex(const Clock& clock, std::vector<std::string> programDirectories)
        : m_clock(clock)
        , m_programDirectories(std::move(programDirectories)) {}

    /// The entry for the executable, given by its path without links; one that is displayed before one that
    /// is not. Null without one. Valid until the next call.
    const Entry* entryForExecutable(const std::string& applicationsDirectory, const std::string& executable);
    const Entry* entryWithID(const std::string& applicationsDirectory, const std::string& id);

private:
    using FileTime = std::filesystem::file_time_type;
    struct Directory {
        Clock::Instant checked;
        FileTime modified;
        bool isThere = false;
        bool settled = false; ///< another change would have shown in `modified`
        std::map<std::string, Entry> byID;
        std::unordered_map<std::string, const Entry*> byExecutable; ///< into byID
    };

    const Directory* directoryAt(const std::string& path);
    Directory readDirectory(const std::string& path, FileTime modified) const;
    std::string executableOf(const std::string& program, const std::string& applicationsDirectory) const;

    const Clock& m_clock;
    std::vector<std::string> m_programDirectories;
    std::unordered_map<std::string, Directory> m_directories;
};

} // namespace platform
