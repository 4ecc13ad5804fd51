#include "platform/linux/GioLaunchServices.h"

#include "platform/LaunchServices.h"
#include "platform/Status.h"
#include "platform/linux/BusApplication.h"
#include "platform/linux/DetachedProgram.h"
#include "platform/linux/ExecLine.h"
#include "platform/linux/GObjectPointer.h"
#include "platform/linux/MessageBus.h"

#include <cstdlib>
#include <filesystem>
#include <gio/gdesktopappinfo.h>
#include <gio/gio.h>
#include <glib.h>
#include <memory>
#include <optional>
#include <string>
#include <system_error>
#include <unistd.h>
#include <utility>
#include <vector>

namespace platform {

namespace fs = std::filesystem;

namespace {

constexpr const char* entrySuffix = ".desktop";

/// What a request comes to: a command, or a name on the bus.
struct Startable {
    std::string path;
    ExecEntry entry;
    Command exec; ///< with its field codes
    std::string directory;
    bool isInTerminal = false;
    std::string busName; ///< empty when it is not to be started over the bus
};

LaunchOutcome Failure(Status status, std::string reason) {
    LaunchOutcome outcome;
    outcome.status = status;
    outcome.reason = std::move(reason);
    return outcome;
}

std::string PathOfURL(const std::string& url) {
    return TakeString(g_filename_from_uri(url.c_str(), nullptr, nullptr));
}

std::string SchemeOf(const std::string& url) {
    return StringOr(g_uri_peek_scheme(url.c_str()));
}

bool IsExecutable(const std::string& path) {
    std::error_code error;
    return fs::is_regular_file(path, error) && access(path.c_str(), X_OK) == 0;
}

/// The words of a command line, quotes undone; none when it is malformed.
Command WordsOfCommandLine(const char* line) {
    Command words;
    char** arguments = nullptr;
    if (line == nullptr || !g_shell_parse_argv(line, nullptr, &arguments, nullptr)) return words;
    for (char** word = arguments; *word != nullptr; ++word)
        words.emplace_back(*word);
    g_strfreev(arguments);
    return words;
}

std::string NameOfIcon(GAppInfo* info) {
    GIcon* icon = g_app_info_get_icon(info);
    return icon != nullptr ? TakeString(g_icon_to_string(icon)) : "";
}

Startable StartableOf(GDesktopAppInfo* info) {
    auto* app = G_APP_INFO(info);
    Startable found;
    found.path = StringOr(g_desktop_app_info_get_filename(info));
    found.entry = {StringOr(g_app_info_get_name(app)), NameOfIcon(app), found.path};
    found.exec = WordsOfCommandLine(g_app_info_get_commandline(app));
    found.directory = TakeString(g_desktop_app_info_get_string(info, "Path"));
    found.isInTerminal = g_desktop_app_info_get_boolean(info, "Terminal") != FALSE;
    const std::string id = fs::path(found.path).stem();
    if (g_desktop_app_info_get_boolean(info, "DBusActivatable") && g_dbus_is_name(id.c_str()))
        found.busName = id;
    return found;
}

GObjectPointer<GDesktopAppInfo> DefaultFor(const std::string& type) {
    return GObjectPointer<GDesktopAppInfo>(
        G_DESKTOP_APP_INFO(g_app_info_get_default_for_type(type.c_str(), FALSE)));
}

/// Why there is nothing to be started, or nothing.
std::optional<LaunchOutcome> FindAtPath(const std::string& path, Startable& found) {
    std::error_code error;
    const std::string absolute = fs::absolute(path, error);
    if (!fs::exists(absolute, error)) return Failure(status::fileNotFound, path + " is not there");
    if (path.ends_with(entrySuffix)) {
        const GObjectPointer<GDesktopAppInfo> info(g_desktop_app_info_new_from_filename(absolute.c_str()));
        if (!info)
            return Failure(status::notAnApplication, path + " is no application's, or its program is gone");
        found = StartableOf(info.get());
        return {};
    }
    if (!IsExecutable(absolute)) return Failure(status::notAnApplication, path + " cannot be executed");
    found.path = absolute;
    found.exec = {absolute, "%F"};
    // A program's own name is no field code.
    for (auto at = found.exec[0].find('%'); at != std::string::npos; at = found.exec[0].find('%', at + 2))
        found.exec[0].insert(at, 1, '%');
    return {};
}

std::optional<LaunchOutcome> Find(const LaunchServices& services, const LaunchRequest& request,
                                  Startable& found) {
    for (const auto& url : request.documentURLs)
        if (SchemeOf(url).empty()) return Failure(status::invalidParameter, url + " is no URL");
    if (!request.applicationPath.empty()) return FindAtPath(request.applicationPath, found);
    if (request.documentURLs.empty()) return Failure(status::invalidParameter, "there is nothing to open");
    const auto type = services.typeOfURL(request.documentURLs.front());
    const auto info = type.empty() ? nullptr : DefaultFor(type);
    if (!info) return Failure(status::applicationNotFound, "nothing opens " + request.documentURLs.front());
    found = StartableOf(info.get());
    return {};
}

std::vector<std::string> VariablesFor(const Startable& what, const LaunchRequest& request) {
    std::vector<std::string> variables;
    if (!what.entry.path.empty()) variables.push_back("GIO_LAUNCHED_DESKTOP_FILE=" + what.entry.path);
    if (!request.properties.empty()) variables.push_back("KX_LAUNCH_PROPERTIES=" + request.properties);
    // Windows that were asked for at the time 0 do not take the keyboard.
    if (request.flags & launchDontSwitch)
        variables.push_back("DESKTOP_STARTUP_ID=kx-" + std::to_string(getpid()) + "_TIME0");
    return variables;
}

bool IsInPath(const char* program) {
    return !TakeString(g_find_program_in_path(program)).empty();
}

LaunchOutcome Execute(const Startable& what, const LaunchRequest& request) {
    LaunchOutcome outcome;
    outcome.applicationPath = what.path;
    if (what.exec.empty()) return Failure(status::notAnApplication, what.path + " names no program");
    for (const auto& command : CommandsOf(what.exec, what.entry, request.documentURLs)) {
        const auto words = what.isInTerminal ? InTerminal(command, IsInPath) : command;
        if (words.empty()) return Failure(status::launchFailed, "there is no terminal");
        auto start = StartDetached(words, what.directory, VariablesFor(what, request));
        if (start.status != status::success) return Failure(start.status, std::move(start.reason));
        if (outcome.pid == 0) outcome.pid = start.pid;
    }
    return outcome;
}

std::string IdentifierOf(GAppInfo* info) {
    std::string id = StringOr(g_app_info_get_id(info));
    if (id.ends_with(entrySuffix)) id.resize(id.size() - std::string_view(entrySuffix).size());
    return id;
}

ApplicationRecord RecordOf(GDesktopAppInfo* info) {
    auto* app = G_APP_INFO(info);
    ApplicationRecord record;
    record.bundleIdentifier = fs::path(StringOr(g_desktop_app_info_get_filename(info))).stem();
    record.name = StringOr(g_app_info_get_name(app));
    record.executable = StringOr(g_app_info_get_executable(app));
    record.icon = NameOfIcon(app);
    record.isUIElement = g_desktop_app_info_get_nodisplay(info) != FALSE;
    constexpr std::string_view schemeType = "x-scheme-handler/";
    const char** types = g_app_info_get_supported_types(app);
    for (; types != nullptr && *types != nullptr; ++types)
        if (const std::string_view type(*types); type.starts_with(schemeType))
            record.urlSchemes.emplace_back(type.substr(schemeType.size()));
    return record;
}

} // namespace

void GioLaunchServices::open(const LaunchRequest& request, LaunchHandler done) {
    Startable what;
    if (const auto failure = Find(*this, request, what)) return done(*failure);
    // The bus carries no properties, and brings to the front what it starts.
    const bool isForBus =
        !what.busName.empty() && request.properties.empty() && !(request.flags & launchDontSwitch);
    const auto bus = isForBus ? ConnectToBus(G_BUS_TYPE_SESSION, nullptr) : nullptr;
    if (!bus) return done(Execute(what, request));
    const auto answer = [done = std::move(done), path = what.path](const std::string& failure) {
        auto outcome = failure.empty() ? LaunchOutcome{} : Failure(status::launchFailed, failure);
        outcome.applicationPath = path;
        done(outcome);
    };
    if (request.flags & launchAsync)
        StartOverBus(bus.get(), what.busName, request.documentURLs, answer);
    else
        answer(StartOverBusAndWait(bus.get(), what.busName, request.documentURLs));
}

std::optional<std::string> GioLaunchServices::openSettings(const std::string& pane) {
    const char* desktop = std::getenv("XDG_CURRENT_DESKTOP");
    const auto command = SettingsCommand(desktop != nullptr ? desktop : "", pane);
    if (command.empty()) return "no settings are known of the desktop \"" + StringOr(desktop) + "\"";
    const auto start = StartDetached(command, {}, {});
    return start.status == status::success ? std::nullopt : std::optional(start.reason);
}

std::string GioLaunchServices::typeOfScheme(const std::string& scheme) const {
    const auto valid = SchemeOf(scheme + ":");
    return valid.size() == scheme.size() && !valid.empty() ? "x-scheme-handler/" + valid : "";
}

std::string GioLaunchServices::typeOfExtension(const std::string& extension) const {
    if (extension.empty() || extension.find('/') != extension.npos) return {};
    const auto name = "file." + extension;
    auto type = TakeString(g_content_type_guess(name.c_str(), nullptr, 0, nullptr));
    return type == "application/octet-stream" ? "" : type;
}

std::string GioLaunchServices::typeOfURL(const std::string& url) const {
    const auto scheme = SchemeOf(url);
    if (scheme != "file") return scheme.empty() ? "" : typeOfScheme(scheme);
    const GObjectPointer<GFile> file(g_file_new_for_uri(url.c_str()));
    const GObjectPointer<GFileInfo> info(g_file_query_info(file.get(), G_FILE_ATTRIBUTE_STANDARD_CONTENT_TYPE,
                                                           G_FILE_QUERY_INFO_NONE, nullptr, nullptr));
    return info ? StringOr(g_file_info_get_content_type(info.get())) : "";
}

std::optional<std::string> GioLaunchServices::defaultApplication(const std::string& type) const {
    const auto info = DefaultFor(type);
    const auto id = info ? IdentifierOf(G_APP_INFO(info.get())) : "";
    return id.empty() ? std::nullopt : std::optional(id);
}

std::vector<std::string> GioLaunchServices::applications(const std::string& type) const {
    std::vector<std::string> ids;
    GList* all = g_app_info_get_all_for_type(type.c_str());
    for (GList* link = all; link != nullptr; link = link->next)
        if (auto id = IdentifierOf(G_APP_INFO(link->data)); !id.empty()) ids.push_back(std::move(id));
    g_list_free_full(all, g_object_unref);
    return ids;
}

Status GioLaunchServices::setDefaultApplication(const std::string& type,
                                                const std::string& bundleIdentifier) {
    const GObjectPointer<GDesktopAppInfo> info(
        g_desktop_app_info_new((bundleIdentifier + entrySuffix).c_str()));
    if (!info) return status::applicationNotFound;
    return g_app_info_set_as_default_for_type(G_APP_INFO(info.get()), type.c_str(), nullptr)
               ? status::success
               : status::launchFailed;
}

std::optional<ApplicationRecord> GioLaunchServices::applicationAtURL(const std::string& url) const {
    const auto path = PathOfURL(url);
    if (path.ends_with(entrySuffix)) {
        const GObjectPointer<GDesktopAppInfo> info(g_desktop_app_info_new_from_filename(path.c_str()));
        return info ? std::optional(RecordOf(info.get())) : std::nullopt;
    }
    if (!IsExecutable(path)) return {};
    ApplicationRecord record;
    record.name = fs::path(path).filename();
    record.executable = path;
    return record;
}

} // namespace platform
