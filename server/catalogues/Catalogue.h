#pragma once

#include "lib/plist/Value.h"

#include <cstddef>
#include <functional>
#include <map>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace tessel {

enum class ItemKind { application, command, folder, separator };

/// One row of a machine's menu.
struct CatalogueItem {
    ItemKind kind = ItemKind::application;
    std::string id = {}; ///< names it within its machine, wherever it stands; empty for separators
    std::string title = {};
    std::string icon = {}; ///< name for the machine's icons; may be empty
    bool enabled = true;
    int state = 0;
    bool hideTriangle = false;
    std::vector<CatalogueItem> children = {};
    std::vector<CatalogueItem> alternate = {}; ///< none or one: takes the item's place while Alt is held

    friend bool operator==(const CatalogueItem&, const CatalogueItem&) = default;
};

/// What a machine offers, in the order in which it is to be shown.
struct Catalogue {
    std::vector<CatalogueItem> programs;
    std::vector<CatalogueItem> topMenu;
    std::vector<CatalogueItem> bottomMenu;
    std::vector<std::string> pinned;   ///< ids of applications among the programs
    std::vector<std::string> frequent; ///< the same: what is shown before anything was launched
    std::string genericIcon;           ///< stands for the icon of an application that has none

    friend bool operator==(const Catalogue&, const Catalogue&) = default;
};

/// Raw icon sets by icon name, shared with every row that shows them. Nil where the machine has no such icon.
using IconSets = std::map<std::string, plist::Value>;

/// Parents before children, an item before its alternate.
void VisitItems(const std::vector<CatalogueItem>& items,
                const std::function<void(const CatalogueItem&)>& visit);
void VisitItems(const Catalogue& catalogue, const std::function<void(const CatalogueItem&)>& visit);

/// The items of a catalogue by id. Of several with one id, as an application that is also a command's row,
/// the first. Points into the catalogue.
class CatalogueIndex {
public:
    CatalogueIndex() = default;
    explicit CatalogueIndex(const Catalogue& catalogue);
    const CatalogueItem* find(const std::string& id) const;

private:
    std::unordered_map<std::string_view, const CatalogueItem*> m_items;
};

} // namespace tessel
