#include "server/catalogues/Categories.h"

#include <QtGlobal>
#include <algorithm>
#include <array>
#include <cstddef>
#include <string_view>

namespace tessel {
namespace {

constexpr std::array folders{
    ProgramFolder{"AudioVideo", QT_TRANSLATE_NOOP("tesselDaemon", "Sound & Video"),
                  "applications-multimedia"},
    ProgramFolder{"Audio", QT_TRANSLATE_NOOP("tesselDaemon", "Sound & Video"), "applications-multimedia"},
    ProgramFolder{"Video", QT_TRANSLATE_NOOP("tesselDaemon", "Sound & Video"), "applications-multimedia"},
    ProgramFolder{"Development", QT_TRANSLATE_NOOP("tesselDaemon", "Development"),
                  "applications-development"},
    ProgramFolder{"Education", QT_TRANSLATE_NOOP("tesselDaemon", "Education"), "applications-education"},
    ProgramFolder{"Game", QT_TRANSLATE_NOOP("tesselDaemon", "Games"), "applications-games"},
    ProgramFolder{"Graphics", QT_TRANSLATE_NOOP("tesselDaemon", "Graphics"), "applications-graphics"},
    ProgramFolder{"Network", QT_TRANSLATE_NOOP("tesselDaemon", "Internet"), "applications-internet"},
    ProgramFolder{"Office", QT_TRANSLATE_NOOP("tesselDaemon", "Office"), "applications-office"},
    ProgramFolder{"Science", QT_TRANSLATE_NOOP("tesselDaemon", "Science"), "applications-science"},
    ProgramFolder{"Settings", QT_TRANSLATE_NOOP("tesselDaemon", "Settings"), "preferences-system"},
    ProgramFolder{"System", QT_TRANSLATE_NOOP("tesselDaemon", "System Tools"), "applications-system"},
    ProgramFolder{"Utility", QT_TRANSLATE_NOOP("tesselDaemon", "Accessories"), "applications-utilities"},
};
constexpr ProgramFolder otherFolder{"", QT_TRANSLATE_NOOP("tesselDaemon", "Other"), "applications-other"};

} // namespace

const ProgramFolder& FolderForCategories(std::string_view categories) {
    while (!categories.empty()) {
        const std::size_t end = std::min(categories.find(';'), categories.size());
        const auto found = std::ranges::find(folders, categories.substr(0, end), &ProgramFolder::category);
        if (found != folders.end()) return *found;
        categories.remove_prefix(std::min(end + 1, categories.size()));
    }
    return otherFolder;
}

} // namespace tessel
