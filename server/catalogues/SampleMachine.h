#pragma once

#include "server/catalogues/Machine.h"
#include "server/catalogues/SampleGuest.h"
#include "server/icons/IconFolder.h"

namespace tessel {

/// The guest that ships with the program, so that a bare computer has a menu to show. There is nothing behind
/// it to start: launching is logged and counts as done.
class SampleMachine final : public Machine {
public:
    /// `folder` holds "guest.toml" and "icons/".
    /// Null, and logged, when the description cannot be used.
    static std::unique_ptr<SampleMachine> open(std::string id, const std::string& folder);

    SampleMachine(std::string id, SampleGuest guest, const std::string& folder);

    std::optional<Catalogue> readCatalogue() override { return m_catalogue; }
    plist::Value readIcon(const std::string& icon) override { return m_icons.read(icon); }
    void launch(const CatalogueItem& item, LaunchHandler done) override;
    /// It never changes.
    std::unique_ptr<platform::Handle> watch(std::function<void()>) override { return nullptr; }

private:
    const Catalogue m_catalogue;
    const IconFolder m_icons;
};

} // namespace tessel
