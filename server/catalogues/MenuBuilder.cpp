#include "server/catalogues/MenuBuilder.h"

#include "lib/plist/Value.h"
#include "server/catalogues/Catalogue.h"

#include <algorithm>
#include <cstddef>
#include <set>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace tessel {
namespace {

constexpr std::size_t maxFrequent = 24; // more than the tallest panel shows

class Builder {
public:
    explicit Builder(const MenuSource& source)
        : m_source(source)
        , m_index(source.catalogue) {}

    plist::Value menu() const {
        const Catalogue& catalogue = m_source.catalogue;
        return plist::Dictionary{
            {"topMenu", list(catalogue.topMenu)},
            {"bottomMenu", list(catalogue.bottomMenu)},
            {"pinnedApps", named(catalogue.pinned)},
            {"frequentlyUsedApps", named(FrequentlyUsed(catalogue, m_source.launches))},
            {"searchableApps", searchable()},
            {"allPrograms", list(catalogue.programs)},
        };
    }

private:
    plist::Value list(const std::vector<CatalogueItem>& items) const {
        plist::Array rows;
        rows.reserve(items.size());
        for (const CatalogueItem& item : items)
            rows.push_back(row(item));
        return rows;
    }

    plist::Value named(const std::vector<std::string>& ids) const {
        plist::Array rows;
        for (const std::string& id : ids)
            if (const CatalogueItem* item = m_index.find(id)) rows.push_back(row(*item));
        return rows;
    }

    /// Every application once, wherever in the tree it stands; alternates are found with what they stand for.
    /// Without the state, which says something in its folder alone.
    void collect(const std::vector<CatalogueItem>& items, std::set<std::string_view>& seen,
                 plist::Array& rows) const {
        for (const CatalogueItem& item : items) {
            if (item.kind == ItemKind::application && seen.insert(item.id).second)
                rows.push_back(row(item, 0));
            collect(item.children, seen, rows);
        }
    }

    plist::Value searchable() const {
        plist::Array rows;
        std::set<std::string_view> seen;
        collect(m_source.catalogue.programs, seen, rows);
        return rows;
    }

    plist::Value row(const CatalogueItem& item) const { return row(item, item.state); }

    plist::Value row(const CatalogueItem& item, int state) const {
        if (item.kind == ItemKind::separator) return plist::Dictionary{{"separatorItem", true}};
        plist::Dictionary row{{"title", item.title}};
        if (item.kind == ItemKind::folder) {
            row.set("submenuInfoArray", list(item.children));
            if (item.hideTriangle) row.set("hideTriangle", true);
        } else {
            row.set("action", ActionName(item.kind));
            row.set("representedObject", TokenText(m_source.machine, item.id));
        }
        if (!item.enabled) row.set("enabled", false);
        if (state != 0) row.set("itemState", state);
        row.set("rawIcons", rawIcons(item));
        if (!item.alternate.empty()) row.set("altMenuItem", this->row(item.alternate.front()));
        return row;
    }

    /// Nil leaves the key out.
    plist::Value rawIcons(const CatalogueItem& item) const {
        const auto set = [this](const std::string& name) {
            const auto found = m_source.icons.find(name);
            return found == m_source.icons.end() ? plist::Value() : found->second;
        };
        plist::Value own = set(item.icon);
        if (!own.isNil() || item.kind != ItemKind::application) return own;
        return set(m_source.catalogue.genericIcon);
    }

    const MenuSource& m_source;
    CatalogueIndex m_index;
};

} // namespace

plist::Value BuildMenu(const MenuSource& source) {
    return Builder(source).menu();
}

std::vector<std::string> FrequentlyUsed(const Catalogue& catalogue, const LaunchCounts& launches) {
    const CatalogueIndex index(catalogue);
    std::vector<std::pair<unsigned, std::string>> launched;
    for (const auto& [id, count] : launches)
        launched.emplace_back(count, id);
    std::ranges::stable_sort(launched, std::ranges::greater(), &std::pair<unsigned, std::string>::first);

    std::set<std::string> taken(catalogue.pinned.begin(), catalogue.pinned.end());
    std::vector<std::string> result;
    const auto take = [&](const std::string& id) {
        const CatalogueItem* item = index.find(id);
        if (!item || item->kind != ItemKind::application || !item->enabled) return;
        if (result.size() < maxFrequent && taken.insert(id).second) result.push_back(id);
    };
    for (const auto& [count, id] : launched)
        take(id);
    for (const std::string& id : catalogue.frequent)
        take(id);
    return result;
}

const char* ActionName(ItemKind kind) {
    switch (kind) {
    case ItemKind::application:
        return "launchApplication:";
    case ItemKind::command:
        return "performCommand:";
    case ItemKind::folder:
    case ItemKind::separator:
        break;
    }
    return "";
}

std::string TokenText(std::string_view machine, std::string_view item) {
    return std::string(machine).append("/").append(item);
}

Token ParseToken(std::string_view text) {
    const std::size_t slash = text.find('/');
    if (slash == text.npos) return {};
    return {std::string(text.substr(0, slash)), std::string(text.substr(slash + 1))};
}

const CatalogueItem* FindItemForAction(const CatalogueIndex& index, const std::string& id,
                                       const plist::Value& action, std::string& refusal) {
    const CatalogueItem* item = index.find(id);
    if (!item)
        refusal = "no such item";
    else if (item->kind == ItemKind::folder)
        refusal = "a folder has no action";
    else if (!action["action"].equalsString(ActionName(item->kind)))
        refusal = "not the item's action";
    else if (!item->enabled)
        refusal = "the item is disabled";
    else
        return item;
    return nullptr;
}

} // namespace tessel
