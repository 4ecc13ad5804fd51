#include "platform/linux/ApplicationIdentifier.h"

#include "platform/Clock.h"
#include "platform/linux/DesktopEntry.h"
#include "platform/linux/DesktopEntryIndex.h"
#include "platform/linux/ProcDirectory.h"
#include "platform/linux/ProcRecords.h"

#include <algorithm>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace platform {

namespace {

/// "/usr" of "/usr/bin/program"; empty for what lies higher.
std::string PrefixOf(std::string_view executable) {
    for (int level = 0; level < 2; ++level)
        executable = executable.substr(0, std::min(executable.rfind('/'), executable.size()));
    return std::string(executable);
}

std::optional<Application> ApplicationOfEntry(const DesktopEntryIndex::Entry* entry) {
    if (!entry) return {};
    return Application{entry->id, entry->path, entry->noDisplay};
}

} // namespace

ApplicationIdentifier::ApplicationIdentifier(const ProcDirectory& processes, const Clock& clock,
                                             const std::vector<std::string>& dataDirectories,
                                             std::vector<std::string> programDirectories)
    : m_processes(processes)
    , m_entries(clock, std::move(programDirectories)) {
    for (const auto& directory : dataDirectories)
        m_applicationsDirectories.push_back(directory + "/applications");
}

ProcessEvidence ApplicationIdentifier::evidenceOf(int pid, int parent) const {
    ProcessEvidence evidence;
    evidence.executable = m_processes.executable(pid);
    evidence.prefixDirectory = PrefixOf(evidence.executable) + "/share/applications";
    evidence.sandboxID = sandboxedID(pid);
    const auto group = m_processes.controlGroup(pid);
    evidence.unitID = ApplicationIDOfControlGroup(group);
    // Whatever was started in a terminal lives in the terminal's unit, and is not the terminal.
    evidence.hasParentInUnit = evidence.unitID && m_processes.controlGroup(parent) == group;
    if (evidence.hasParentInUnit) evidence.unitID.reset();
    return evidence;
}

std::optional<Application> ApplicationIdentifier::applicationOf(const ProcessEvidence& evidence) {
    if (evidence.sandboxID) return applicationWithID(*evidence.sandboxID);
    if (auto application = inDirectory(evidence.prefixDirectory, evidence.executable)) return application;
    if (evidence.unitID) return applicationWithID(*evidence.unitID);
    for (const auto& directory : m_applicationsDirectories)
        if (auto application = inDirectory(directory, evidence.executable)) return application;
    return {};
}

std::optional<Application> ApplicationIdentifier::inDirectory(const std::string& applicationsDirectory,
                                                              const std::string& executable) {
    return ApplicationOfEntry(m_entries.entryForExecutable(applicationsDirectory, executable));
}

std::optional<std::string> ApplicationIdentifier::sandboxedID(int pid) const {
    const auto info = m_processes.sandboxInfo(pid);
    if (!info) return {};
    const std::string id(KeyFileGroup(*info, "Application")["name"]);
    return id.empty() || id.find('/') != id.npos ? std::nullopt : std::optional(id);
}

Application ApplicationIdentifier::applicationWithID(const std::string& id) {
    for (const auto& directory : m_applicationsDirectories)
        if (auto application = ApplicationOfEntry(m_entries.entryWithID(directory, id))) return *application;
    return {id, {}, false};
}

} // namespace platform
