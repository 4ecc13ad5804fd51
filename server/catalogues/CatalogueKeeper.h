#pragma once

#include "server/Worker.h"
#include "server/catalogues/Machine.h"

#include <memory>
#include <set>

namespace tessel {

/// What is known of a machine at this moment, and the reading that brings it up to date. Main thread only;
/// the executor runs no answer after the keeper's end.
class CatalogueKeeper {
public:
    /// Calls `changed` when there is something new to show: at the first reading also before the icons are
    /// there.
    CatalogueKeeper(Machine& machine, Executor execute, std::function<void()> changed);

    Machine& machine() const { return m_machine; }
    bool isRead() const { return m_everRead; } ///< before, there is nothing to show
    const Catalogue& catalogue() const { return m_known->catalogue; }
    const IconSets& icons() const { return m_known->icons; }
    const CatalogueIndex& index() const { return m_known->index; }

    /// Reads what was never read or has changed since; else looks again, a few times, for icons that were not
    /// there: a package brings its entry before its icons.
    void refresh();

private:
    struct Known {
        explicit Known(Catalogue read, IconSets sets)
            : catalogue(std::move(read))
            , icons(std::move(sets))
            , index(catalogue) {}
        Catalogue catalogue;
        IconSets icons;
        CatalogueIndex index;
    };

    void readCatalogue();
    void onCatalogue(std::optional<Catalogue> read);
    void readIcons(const std::set<std::string>& names, bool keepOthers);
    void onIcons(IconSets read, bool keepOthers);
    std::set<std::string> missingIcons() const;

    Machine& m_machine;
    Executor m_execute;
    std::function<void()> m_changed;
    std::unique_ptr<Known> m_known;
    bool m_stale = true;
    bool m_reading = false;
    bool m_everRead = false;
    int m_looksLeft = 0;
    std::unique_ptr<platform::Handle> m_watch;
};

} // namespace tessel
