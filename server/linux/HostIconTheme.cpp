#include "server/linux/HostIconTheme.h"

#include "platform/linux/GObjectPointer.h"
#include "server/icons/ThemeIcons.h"

#include <algorithm>
#include <filesystem>
#include <gio/gio.h>
#include <glib.h>
#include <memory>
#include <string>
#include <system_error>
#include <vector>

namespace tessel {
namespace {

using platform::GObjectPointer;
using platform::StringOr;
using platform::TakeString;

struct KeyFileFree {
    void operator()(GKeyFile* file) const { g_key_file_free(file); }
};

std::string KeyFileValue(const char* file, const char* group, const char* key) {
    const std::string path = StringOr(g_get_user_config_dir()) + "/" + file;
    const std::unique_ptr<GKeyFile, KeyFileFree> keys(g_key_file_new());
    if (!g_key_file_load_from_file(keys.get(), path.c_str(), G_KEY_FILE_NONE, nullptr)) return {};
    return TakeString(g_key_file_get_string(keys.get(), group, key, nullptr));
}

/// Asking for a schema that is not installed would end the process, so its presence is looked up first.
std::string DesktopSetting(const char* schemaName, const char* key) {
    GSettingsSchemaSource* source = g_settings_schema_source_get_default();
    GSettingsSchema* schema = source ? g_settings_schema_source_lookup(source, schemaName, TRUE) : nullptr;
    if (!schema) return {};
    std::string value;
    if (g_settings_schema_has_key(schema, key)) {
        const GObjectPointer<GSettings> settings(g_settings_new_full(schema, nullptr, nullptr));
        value = TakeString(g_settings_get_string(settings.get(), key));
    }
    g_settings_schema_unref(schema);
    return value;
}

std::string KdeTheme() {
    return KeyFileValue("kdeglobals", "Icons", "Theme");
}
std::string GtkTheme() {
    return KeyFileValue("gtk-3.0/settings.ini", "Settings", "gtk-icon-theme-name");
}
std::string GnomeTheme() {
    return DesktopSetting("org.gnome.desktop.interface", "icon-theme");
}

bool IsDesktop(const char* name) {
    return (":" + StringOr(g_getenv("XDG_CURRENT_DESKTOP")) + ":").find(":" + std::string(name) + ":") !=
           std::string::npos;
}

bool IsInstalled(const std::string& theme, const std::vector<std::string>& folders) {
    return !theme.empty() && std::ranges::any_of(folders, [&](const std::string& folder) {
        std::error_code ignored;
        return std::filesystem::exists(folder + "/" + theme + "/index.theme", ignored);
    });
}

} // namespace

ThemeIcons::Places HostIconPlaces() {
    ThemeIcons::Places places;
    places.themeFolders = {StringOr(g_get_home_dir()) + "/.icons",
                           StringOr(g_get_user_data_dir()) + "/icons"};
    for (const char* const* folder = g_get_system_data_dirs(); *folder; ++folder) {
        places.themeFolders.push_back(std::string(*folder) + "/icons");
        places.looseFolders.push_back(std::string(*folder) + "/pixmaps");
    }
    std::vector<std::string> candidates = {GtkTheme(), GnomeTheme(), "Adwaita"};
    candidates.insert(IsDesktop("KDE") ? candidates.begin() : candidates.end() - 1, KdeTheme());
    const auto chosen = std::ranges::find_if(
        candidates, [&](const std::string& theme) { return IsInstalled(theme, places.themeFolders); });
    places.fallbackTheme = "hicolor";
    places.theme = chosen == candidates.end() ? places.fallbackTheme : *chosen;
    return places;
}

} // namespace tessel
