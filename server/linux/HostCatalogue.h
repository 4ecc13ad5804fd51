#pragma once

#include "server/catalogues/Catalogue.h"

namespace tessel {

/// Rows of this computer whose id begins with this open the folder whose URI follows; all others are desktop
/// entries, named by their file names.
inline constexpr std::string_view placePrefix = "place:";

/// Reads the desktop entries of this computer and the places of its user, names in the user's language. Only
/// what is to be shown on this desktop and whose program exists. Any thread.
Catalogue ReadHostCatalogue();

} // namespace tessel
