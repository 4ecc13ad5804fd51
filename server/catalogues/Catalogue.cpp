#include "server/catalogues/Catalogue.h"

#include <functional>
#include <vector>

namespace tessel {

void VisitItems(const std::vector<CatalogueItem>& items,
                const std::function<void(const CatalogueItem&)>& visit) {
    for (const CatalogueItem& item : items) {
        visit(item);
        VisitItems(item.alternate, visit);
        VisitItems(item.children, visit);
    }
}

void VisitItems(const Catalogue& catalogue, const std::function<void(const CatalogueItem&)>& visit) {
    for (const auto* list : {&catalogue.programs, &catalogue.topMenu, &catalogue.bottomMenu})
        VisitItems(*list, visit);
}

CatalogueIndex::CatalogueIndex(const Catalogue& catalogue) {
    VisitItems(catalogue, [this](const CatalogueItem& item) {
        if (!item.id.empty()) m_items.try_emplace(item.id, &item);
    });
}

const CatalogueItem* CatalogueIndex::find(const std::string& id) const {
    const auto found = m_items.find(id);
    return found == m_items.end() ? nullptr : found->second;
}

} // namespace tessel
