#include "server/catalogues/CatalogueKeeper.h"

#include "server/Worker.h"
#include "server/catalogues/Catalogue.h"
#include "server/catalogues/Machine.h"

#include <cstddef>
#include <functional>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <utility>

namespace tessel {
namespace {

constexpr int looksForMissingIcons = 3;
constexpr std::size_t maxIcons = 2000; // at 80 KB each, what one message carries with room to spare

/// Those that a catalogue names, the first `maxIcons` of them.
std::set<std::string> IconNames(const Catalogue& catalogue) {
    std::set<std::string> names;
    const auto take = [&](const std::string& name) {
        if (!name.empty() && names.size() < maxIcons) names.insert(name);
    };
    take(catalogue.genericIcon);
    VisitItems(catalogue, [&](const CatalogueItem& item) { take(item.icon); });
    return names;
}

} // namespace

CatalogueKeeper::CatalogueKeeper(Machine& machine, Executor execute, std::function<void()> changed)
    : m_machine(machine)
    , m_execute(std::move(execute))
    , m_changed(std::move(changed))
    , m_known(std::make_unique<Known>(Catalogue{}, IconSets{}))
    , m_watch(machine.watch([this] {
        m_stale = true;
        refresh();
    })) {}

void CatalogueKeeper::refresh() {
    if (m_reading) return;
    if (m_stale) return readCatalogue();
    if (m_looksLeft == 0) return;
    --m_looksLeft;
    m_reading = true;
    readIcons(missingIcons(), true);
}

void CatalogueKeeper::readCatalogue() {
    m_reading = true;
    m_stale = false;
    m_execute([this, &machine = m_machine] {
        return [this, read = machine.readCatalogue()]() mutable { onCatalogue(std::move(read)); };
    });
}

void CatalogueKeeper::onCatalogue(std::optional<Catalogue> read) {
    if (!read || (m_everRead && *read == m_known->catalogue)) {
        m_reading = false;
        if (!read)
            m_stale = true; // read again when asked, not at once
        else if (m_stale)
            refresh();
        return;
    }
    // The icons that are known stay until the new ones are there.
    m_known = std::make_unique<Known>(std::move(*read), std::move(m_known->icons));
    if (!std::exchange(m_everRead, true)) m_changed();
    readIcons(IconNames(m_known->catalogue), false);
}

void CatalogueKeeper::readIcons(const std::set<std::string>& names, bool keepOthers) {
    m_execute([this, &machine = m_machine, names, keepOthers] {
        IconSets sets;
        for (const std::string& name : names)
            sets.emplace(name, machine.readIcon(name));
        return [this, sets = std::move(sets), keepOthers]() mutable { onIcons(std::move(sets), keepOthers); };
    });
}

void CatalogueKeeper::onIcons(IconSets read, bool keepOthers) {
    m_reading = false;
    bool found = !keepOthers;
    if (keepOthers) {
        for (auto& [name, set] : read) {
            found = found || !set.isNil();
            m_known->icons[name] = std::move(set);
        }
    } else {
        m_known->icons = std::move(read);
        m_looksLeft = looksForMissingIcons;
    }
    if (missingIcons().empty()) m_looksLeft = 0;
    if (found) m_changed();
    if (m_stale) refresh();
}

std::set<std::string> CatalogueKeeper::missingIcons() const {
    std::set<std::string> names;
    for (const auto& [name, set] : m_known->icons)
        if (set.isNil()) names.insert(name);
    return names;
}

} // namespace tessel
