#pragma once

#include "lib/kxAppKit/system/KXProcess.h"
#include "lib/plist/Value.h"
#include "platform/LaunchServices.h"
#include "platform/ProcessTable.h"
#include "platform/Session.h"
#include "platform/UserDefaults.h"
#include "platform/Workspace.h"

#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

class KXAppleEvent;

/// Questions to the desktop's session, and what it starts for us. Needs no GUI of ours. Main thread only; the
/// services must outlive it.
class KXWorkspace {
public:
    struct Services {
        platform::ProcessTable& processes;
        const platform::Workspace& windows;
        const platform::Session& session;
        const platform::UserDefaults& dock; ///< the domain "com.apple.dock"
        platform::LaunchServices& launching;
    };

    explicit KXWorkspace(Services services)
        : m_services(services) {}

    /// Exact and case-sensitive.
    bool isAppWithBundleIdentifierRunning(std::string_view bundleID) const;
    /// The same for any of several, for the price of one walk.
    bool isAppWithBundleIdentifierRunning(std::span<const std::string_view> anyOfThese) const;

    /// Launches a desktop entry or an executable, and answers a status code, 0 for success. `synchronously`
    /// waits until the program has started or failed to; otherwise what would take long is not waited for.
    /// `properties` and `process` may be null. `process` becomes the new process, or null when there is none
    /// to be seen yet.
    int launchAppWithPath(const std::string& path, bool activate, bool synchronously,
                          const KXAppleEvent* properties, const std::vector<std::string>& openDocumentURLs,
                          KXProcess::Pointer* process) const;

    /// Of the desktop that is shown, from 1; 1, and logged, when nobody tells.
    unsigned currentWorkspaceNumber() const;
    void currentWorkspaceLayoutColumns(unsigned& columns, unsigned& rows) const;
    /// False without a session.
    bool currentUserSessionIsActive() const;
    /// Opens the desktop's settings at a page, named as the desktop names it; logged when that fails.
    void openSystemPreferencesPane(const std::string& paneID) const;

    // Who opens what. Nothing, or nil, when nobody does or on any error.
    using Launching = platform::LaunchServices;
    using Identifier = std::optional<std::string>;
    using Identifiers = std::optional<std::vector<std::string>>; ///< never an empty one
    static Identifier bundleIdentifierOfDefaultApplicationForURLScheme(const Launching& launching,
                                                                       const std::string& scheme);
    static Identifiers bundleIdentifiersOfApplicationsForURLScheme(const Launching& launching,
                                                                   const std::string& scheme);
    static Identifier bundleIdentifierOfDefaultApplicationForFileExtension(const Launching& launching,
                                                                           const std::string& extension);
    static Identifier bundleIdentifierOfAssignedApplicationForFileOrURL(const Launching& launching,
                                                                        const std::string& url);
    static Identifiers bundleIdentifiersOfApplicationsForFileOrURL(const Launching& launching,
                                                                   const std::string& url);
    static Identifier bundleIdentifierOfApplicationAtURL(const Launching& launching, const std::string& url);
    /// "CFBundleIdentifier", "CFBundleName", "CFBundleExecutable", "CFBundleIconFile", "CFBundleURLTypes",
    /// "LSUIElement", as far as they are known.
    static plist::Value bundleInfoDictionaryOfApplicationAtURL(const Launching& launching,
                                                               const std::string& url);
    /// Answers a status code, 0 for success.
    static int setDefaultHandlerForURLScheme(Launching& launching, const std::string& scheme,
                                             const std::string& bundleIdentifier);

private:
    KXProcess::Pointer launchedProcess(const platform::LaunchOutcome& outcome) const;

    Services m_services;
};
