#include "lib/kxAppKit/system/KXWorkspace.h"

#include "lib/base/Log.h"
#include "lib/kxAppKit/system/KXAppleEvent.h"
#include "lib/kxAppKit/system/KXFileURL.h"
#include "lib/kxAppKit/system/KXProcess.h"
#include "platform/LaunchServices.h"
#include "platform/Status.h"

#include <algorithm>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <vector>

using namespace platform; // NOLINT(google-build-using-namespace): what this class is made of

bool KXWorkspace::isAppWithBundleIdentifierRunning(std::string_view bundleID) const {
    return KXProcess::processWithBundleIdentifier(m_services.processes, bundleID) != nullptr;
}

bool KXWorkspace::isAppWithBundleIdentifierRunning(std::span<const std::string_view> anyOfThese) const {
    auto processes = KXProcess::processEnumerator(m_services.processes);
    while (const auto process = processes.nextObject()) {
        const auto& id = process->bundleIdentifier();
        if (id && std::ranges::find(anyOfThese, *id) != anyOfThese.end()) return true;
    }
    return false;
}

int KXWorkspace::launchAppWithPath(const std::string& path, bool activate, bool synchronously,
                                   const KXAppleEvent* properties,
                                   const std::vector<std::string>& openDocumentURLs,
                                   KXProcess::Pointer* process) const {
    if (process) process->reset();
    if (path.empty()) return status::invalidParameter;
    if (!KXFileURLOfPath(path)) return status::badName;
    LaunchRequest request;
    request.applicationPath = path;
    request.documentURLs = openDocumentURLs;
    if (!activate) request.flags |= launchDontSwitch;
    if (!synchronously) request.flags |= launchAsync;
    if (properties) properties->copyIntoEventRecord(request.properties);
    // Shared, because the answer may come after this has returned.
    const auto outcome = std::make_shared<LaunchOutcome>();
    outcome->applicationPath = path;
    m_services.launching.open(request, [outcome](const LaunchOutcome& known) { *outcome = known; });
    if (outcome->status == status::success && process) *process = launchedProcess(*outcome);
    return outcome->status;
}

KXProcess::Pointer KXWorkspace::launchedProcess(const LaunchOutcome& outcome) const {
    // By its URL alone would look right and is wrong: an older process of that application may come first.
    auto& processes = m_services.processes;
    if (const auto started = processes.serialNumberOf(outcome.pid))
        return KXProcess::processWithSerialNumber(processes, *started);
    const auto url = KXFileURLOfPath(outcome.applicationPath);
    return url ? KXProcess::processWithURL(processes, *url) : nullptr;
}

unsigned KXWorkspace::currentWorkspaceNumber() const {
    unsigned number = 0;
    const Status error = m_services.windows.currentDesktop(number);
    if (error == status::success) return number + 1;
    Log("%s: Couldn't get current workspace, error %d.\n",
        "-[NSWorkspace(KXAppKitAdditions) currentWorkspaceNumber]", error);
    return 1;
}

void KXWorkspace::currentWorkspaceLayoutColumns(unsigned& columns, unsigned& rows) const {
    const auto count = [this](const char* key) {
        const int number = m_services.dock.integerForKey(key);
        return number < 1 ? 2u : static_cast<unsigned>(number);
    };
    const bool hasWorkspaces = m_services.dock.integerForKey("workspaces") != 0;
    columns = hasWorkspaces ? count("workspaces-cols") : 1;
    rows = hasWorkspaces ? count("workspaces-rows") : 1;
}

bool KXWorkspace::currentUserSessionIsActive() const {
    return m_services.session.isActive().value_or(false);
}

void KXWorkspace::openSystemPreferencesPane(const std::string& paneID) const {
    if (const auto failure = m_services.launching.openSettings(paneID))
        Log("%s, executing apple script failed. Error Info: %s\n",
            "-[NSWorkspace(KXAppKitAdditions) openSystemPreferencesPane:]", failure->c_str());
}
