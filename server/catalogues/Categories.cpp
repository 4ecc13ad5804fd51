#include "server/catalogues/Categories.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <string_view>

namespace tessel {
namespace {

constexpr std::array folders{
    ProgramFolder{"AudioVideo", "Sound & Video", "applications-multimedia"},
    ProgramFolder{"Audio", "Sound & Video", "applications-multimedia"},
    ProgramFolder{"Video", "Sound & Video", "applications-multimedia"},
    ProgramFolder{"Development", "Development", "applications-development"},
    ProgramFolder{"Education", "Education", "applications-education"},
    ProgramFolder{"Game", "Games", "applications-games"},
    ProgramFolder{"Graphics", "Graphics", "applications-graphics"},
    ProgramFolder{"Network", "Internet", "applications-internet"},
    ProgramFolder{"Office", "Office", "applications-office"},
    ProgramFolder{"Science", "Science", "applications-science"},
    ProgramFolder{"Settings", "Settings", "preferences-system"},
    ProgramFolder{"System", "System Tools", "applications-system"},
    ProgramFolder{"Utility", "Accessories", "applications-utilities"},
};
constexpr ProgramFolder otherFolder{"", "Other", "applications-other"};

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
