#include "platform/linux/DesktopEntryIndex.h"

#include "platform/linux/DesktopEntry.h"
#include "platform/linux/SmallFile.h"

#include <chrono>
#include <cstddef>
#include <fcntl.h>
#include <filesystem>
#include <optional>
#include <string>
#include <system_error>
#include <vector>

namespace fs = std::filesystem;

namespace platform {

namespace {

constexpr std::size_t largestEntry = std::size_t{256} << 10;
constexpr std::size_t mostEntries = 10'000;

/// For how long a directory is taken to be as it was. Longer than the grain of file times: a directory that
/// changed less than this before it was read may change again under the same time.
constexpr std::chrono::milliseconds grace{100};

template <typename Map>
auto Find(const Map& map, const std::string& key) {
    const auto found = map.find(key);
    return found == map.end() ? nullptr : &found->second;
}

} // namespace

const DesktopEntryIndex::Entry*
DesktopEntryIndex::entryForExecutable(const std::string& applicationsDirectory,
                                      const std::string& executable) {
    const auto* directory = directoryAt(applicationsDirectory);
    const auto* entry = directory ? Find(directory->byExecutable, executable) : nullptr;
    return entry ? *entry : nullptr;
}

const DesktopEntryIndex::Entry* DesktopEntryIndex::entryWithID(const std::string& applicationsDirectory,
                                                               const std::string& id) {
    const auto* directory = directoryAt(applicationsDirectory);
    return directory ? Find(directory->byID, id) : nullptr;
}

const DesktopEntryIndex::Directory* DesktopEntryIndex::directoryAt(const std::string& path) {
    const auto now = m_clock.now();
    const auto [known, isNew] = m_directories.try_emplace(path);
    auto& directory = known->second;
    if (isNew || now - directory.checked >= grace) {
        std::error_code error;
        const auto modified = fs::last_write_time(path, error);
        if (error)
            directory = {};
        else if (!directory.settled || directory.modified != modified)
            directory = readDirectory(path, modified);
        directory.checked = now;
    }
    return directory.isThere ? &directory : nullptr;
}

DesktopEntryIndex::Directory DesktopEntryIndex::readDirectory(const std::string& path,
                                                              FileTime modified) const {
    Directory directory;
    directory.isThere = true;
    directory.modified = modified;
    directory.settled = FileTime::clock::now() - modified > grace;
    std::error_code error;
    for (fs::directory_iterator file(path, error), end; file != end; file.increment(error)) {
        if (file->path().extension() != ".desktop") continue;
        const auto text = ReadSmallFile(AT_FDCWD, file->path(), largestEntry, Links::follow);
        const auto parsed = text ? ParseDesktopEntry(*text) : std::nullopt;
        if (!parsed) continue;
        const std::string id = file->path().stem();
        directory.byID[id] = {id, file->path(), executableOf(parsed->program, path), parsed->noDisplay};
        if (directory.byID.size() >= mostEntries) break;
    }
    for (const bool noDisplay : {false, true})
        for (const auto& [id, entry] : directory.byID)
            if (entry.noDisplay == noDisplay && !entry.executable.empty())
                directory.byExecutable.try_emplace(entry.executable, &entry);
    return directory;
}

std::string DesktopEntryIndex::executableOf(const std::string& program,
                                            const std::string& applicationsDirectory) const {
    if (program.empty()) return {};
    std::vector<fs::path> candidates;
    if (program.find('/') != program.npos) {
        candidates.emplace_back(program);
    } else {
        candidates.push_back(fs::path(applicationsDirectory).parent_path().parent_path() / "bin" / program);
        for (const auto& directory : m_programDirectories)
            candidates.push_back(fs::path(directory) / program);
    }
    for (const auto& candidate : candidates) {
        std::error_code error;
        // Resolving asks for every part of a path: not where nothing is, as in most directories.
        if (!fs::exists(candidate, error)) continue;
        auto executable = fs::canonical(candidate, error);
        if (!error) return executable;
    }
    return {};
}

} // namespace platform
