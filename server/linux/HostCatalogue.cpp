#include "server/linux/HostCatalogue.h"

#include "platform/linux/GObjectPointer.h"
#include "server/Texts.h"
#include "server/catalogues/Catalogue.h"
#include "server/catalogues/Categories.h"

#include <QtGlobal>
#include <algorithm>
#include <cstddef>
#include <filesystem>
#include <gio/gdesktopappinfo.h>
#include <gio/gio.h>
#include <glib.h>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

namespace tessel {
namespace {

using platform::GFree;
using platform::GObjectPointer;
using platform::StringOr;
using platform::TakeString;

constexpr const char* genericIcon = "application-x-executable";
constexpr std::size_t frequentCount = 8;

struct Entry {
    CatalogueItem item;
    std::string categories; ///< as the entry has them, with a ';' before and behind
};

bool IsInCategory(const Entry& entry, std::string_view category) {
    return entry.categories.find(";" + std::string(category) + ";") != std::string::npos;
}

std::string IconName(GAppInfo* info) {
    GIcon* icon = g_app_info_get_icon(info);
    if (!icon) return {};
    if (G_IS_THEMED_ICON(icon)) return StringOr(g_themed_icon_get_names(G_THEMED_ICON(icon))[0]);
    return TakeString(g_icon_to_string(icon));
}

std::optional<Entry> ReadEntry(GAppInfo* info) {
    const std::string id = StringOr(g_app_info_get_id(info));
    if (id.empty() || !g_app_info_should_show(info)) return std::nullopt;
    Entry entry;
    entry.item.id = id;
    entry.item.title = StringOr(g_app_info_get_display_name(info), id.c_str());
    entry.item.icon = IconName(info);
    entry.categories = ";" + StringOr(g_desktop_app_info_get_categories(G_DESKTOP_APP_INFO(info))) + ";";
    return entry;
}

/// By title, as people of the user's language sort.
std::string SortKey(const std::string& title) {
    const std::unique_ptr<char, GFree> folded(g_utf8_casefold(title.c_str(), -1));
    return TakeString(g_utf8_collate_key(folded.get(), -1));
}

template <typename Element, typename Title>
void SortByTitle(std::vector<Element>& elements, Title title) {
    std::ranges::sort(elements, std::ranges::less(), [&](const Element& element) {
        return std::pair(SortKey(title(element)), title(element));
    });
}

std::vector<Entry> ReadEntries() {
    std::vector<Entry> entries;
    GList* all = g_app_info_get_all();
    for (GList* link = all; link; link = link->next)
        if (auto entry = ReadEntry(G_APP_INFO(link->data))) entries.push_back(std::move(*entry));
    g_list_free_full(all, g_object_unref);
    SortByTitle(entries, [](const Entry& entry) { return entry.item.title; });
    return entries;
}

std::string FolderId(const ProgramFolder& folder) {
    return std::string("folder:") + folder.title;
}

std::vector<CatalogueItem> FoldersOf(const std::vector<Entry>& entries) {
    std::vector<CatalogueItem> folders;
    for (const Entry& entry : entries) {
        const ProgramFolder& folder = FolderForCategories(entry.categories);
        const std::string id = FolderId(folder);
        auto found = std::ranges::find(folders, id, &CatalogueItem::id);
        if (found == folders.end())
            found = folders.insert(folders.end(), {.kind = ItemKind::folder,
                                                   .id = id,
                                                   .title = Localized(folder.title),
                                                   .icon = std::string(folder.icon)});
        found->children.push_back(entry.item);
    }
    SortByTitle(folders, [](const CatalogueItem& folder) { return folder.title; });
    return folders;
}

std::optional<CatalogueItem> Place(const std::string& path, const char* title, const char* icon) {
    std::error_code ignored;
    if (path.empty() || !std::filesystem::is_directory(path, ignored)) return std::nullopt;
    const GObjectPointer<GFile> file(g_file_new_for_path(path.c_str()));
    return CatalogueItem{.kind = ItemKind::command,
                         .id = std::string(placePrefix) + TakeString(g_file_get_uri(file.get())),
                         .title = title ? Localized(title) : std::filesystem::path(path).filename().string(),
                         .icon = icon};
}

struct SpecialFolder {
    GUserDirectory directory;
    const char* icon;
};
constexpr SpecialFolder mainFolders[] = {
    {G_USER_DIRECTORY_DOCUMENTS, "folder-documents"}, {G_USER_DIRECTORY_DOWNLOAD, "folder-download"},
    {G_USER_DIRECTORY_PICTURES, "folder-pictures"},   {G_USER_DIRECTORY_MUSIC, "folder-music"},
    {G_USER_DIRECTORY_VIDEOS, "folder-videos"},
};
constexpr SpecialFolder otherFolders[] = {
    {G_USER_DIRECTORY_DESKTOP, "user-desktop"},
    {G_USER_DIRECTORY_PUBLIC_SHARE, "folder-publicshare"},
    {G_USER_DIRECTORY_TEMPLATES, "folder-templates"},
};

/// The user's own folders; one that is the home directory is one that the user does without.
void AddSpecialFolders(std::span<const SpecialFolder> folders, std::vector<CatalogueItem>& items) {
    const std::string home = g_get_home_dir();
    for (const SpecialFolder& folder : folders) {
        const std::string path = StringOr(g_get_user_special_dir(folder.directory));
        if (path == home) continue;
        if (auto place = Place(path, nullptr, folder.icon)) items.push_back(std::move(*place));
    }
}

std::vector<CatalogueItem> TopMenu(const std::vector<CatalogueItem>& programs) {
    std::vector<CatalogueItem> items;
    if (auto home = Place(g_get_home_dir(), QT_TRANSLATE_NOOP("tesselDaemon", "Home"), "user-home"))
        items.push_back(std::move(*home));
    AddSpecialFolders(mainFolders, items);

    CatalogueItem places{.kind = ItemKind::folder,
                         .id = "folder:/",
                         .title = Localized(QT_TRANSLATE_NOOP("tesselDaemon", "Places")),
                         .icon = "folder"};
    AddSpecialFolders(otherFolders, places.children);
    if (auto root = Place("/", QT_TRANSLATE_NOOP("tesselDaemon", "File System"), "drive-harddisk"))
        places.children.push_back(std::move(*root));
    items.push_back(std::move(places));

    const auto settings =
        std::ranges::find(programs, FolderId(FolderForCategories("Settings")), &CatalogueItem::id);
    if (settings != programs.end()) {
        items.push_back({.kind = ItemKind::separator});
        items.push_back(*settings);
    }
    return items;
}

std::string DefaultFor(const char* type) {
    const GObjectPointer<GAppInfo> info(g_app_info_get_default_for_type(type, FALSE));
    return info ? StringOr(g_app_info_get_id(info.get())) : "";
}

/// What most people want at hand, as far as it is here: ids, each once.
std::vector<std::string> Essentials(const std::vector<Entry>& entries) {
    std::vector<std::string> ids;
    const auto take = [&](const auto& matches) {
        const auto found = std::ranges::find_if(entries, matches);
        if (found != entries.end() && std::ranges::find(ids, found->item.id) == ids.end())
            ids.push_back(found->item.id);
    };
    for (const char* type : {"x-scheme-handler/https", "x-scheme-handler/mailto", "inode/directory"})
        take([id = DefaultFor(type)](const Entry& entry) { return entry.item.id == id; });
    take([](const Entry& entry) { return IsInCategory(entry, "TerminalEmulator"); });
    return ids;
}

/// Suggestions for a menu from which nothing was launched yet.
std::vector<std::string> Suggestions(const std::vector<Entry>& entries) {
    std::vector<std::string> ids;
    if (const std::string editor = DefaultFor("text/plain"); !editor.empty()) ids.push_back(editor);
    for (const Entry& entry : entries)
        if (ids.size() < frequentCount && !IsInCategory(entry, "Settings")) ids.push_back(entry.item.id);
    return ids;
}

} // namespace

Catalogue ReadHostCatalogue() {
    const std::vector<Entry> entries = ReadEntries();
    Catalogue catalogue;
    catalogue.genericIcon = genericIcon;
    catalogue.programs = FoldersOf(entries);
    catalogue.topMenu = TopMenu(catalogue.programs);
    catalogue.pinned = Essentials(entries);
    catalogue.frequent = Suggestions(entries);
    for (const Entry& entry : entries)
        if (IsInCategory(entry, "TerminalEmulator") || IsInCategory(entry, "FileManager"))
            catalogue.bottomMenu.push_back(entry.item);
    return catalogue;
}

} // namespace tessel
