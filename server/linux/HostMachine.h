#pragma once

#include "server/catalogues/Machine.h"
#include "server/icons/ThemeIcons.h"

namespace tessel {

/// This computer: its desktop entries, the icons of its theme.
class HostMachine final : public Machine {
public:
    HostMachine(std::string id, std::string name)
        : Machine(std::move(id), std::move(name)) {}

    std::optional<Catalogue> readCatalogue() override;
    plist::Value readIcon(const std::string& icon) override;
    /// The program becomes a child of nobody: it outlives us. Needs GLib's default main context to run.
    void launch(const CatalogueItem& item, LaunchHandler done) override;
    /// Needs GLib's default main context to run.
    std::unique_ptr<platform::Handle> watch(std::function<void()> changed) override;

private:
    ThemeIcons m_icons; ///< of the worker thread
};

} // namespace tessel
