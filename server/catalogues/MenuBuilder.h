#pragma once

#include "server/catalogues/Catalogue.h"

#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <vector>

/// From a catalogue to the dictionaries of "menu.update", and back from an action to the item it names.
namespace tessel {

/// How often each item was launched, by id.
using LaunchCounts = std::map<std::string, unsigned>;

struct MenuSource {
    std::string_view machine; ///< the machine's id
    const Catalogue& catalogue;
    const IconSets& icons;
    const LaunchCounts& launches;
};

/// The "menu" dictionary.
plist::Value BuildMenu(const MenuSource& source);

/// The ids of the frequently used applications: most launched first, then the catalogue's own suggestions;
/// neither pinned nor disabled ones.
std::vector<std::string> FrequentlyUsed(const Catalogue& catalogue, const LaunchCounts& launches);

/// The name under which an item's action travels.
const char* ActionName(ItemKind kind);

/// What "representedObject" holds: machine and item. Split at the first '/', as item ids may hold more of
/// them.
struct Token {
    std::string machine;
    std::string item;
};
std::string TokenText(std::string_view machine, std::string_view item);
Token ParseToken(std::string_view text);

/// The item that an action dictionary names, or null with the reason in `refusal`: nothing of that id,
/// another action than the item's, or an item that cannot be chosen.
const CatalogueItem* FindItemForAction(const CatalogueIndex& index, const std::string& item,
                                       const plist::Value& action, std::string& refusal);

} // namespace tessel
