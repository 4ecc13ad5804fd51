#pragma once

#include <string_view>

namespace tessel {

/// A folder of the tree of programs, for one of the main categories of desktop entries.
struct ProgramFolder {
    std::string_view category;
    const char* title; ///< English, to be localised
    std::string_view icon;
};

/// The folder for an entry with these categories ("A;B;C;"): that of the first main category among them, or
/// the folder for all others.
const ProgramFolder& FolderForCategories(std::string_view categories);

} // namespace tessel
