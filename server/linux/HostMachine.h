#pragma once

#include "platform/LaunchServices.h"
#include "server/catalogues/Machine.h"
#include "server/icons/ThemeIcons.h"

#include <memory>

namespace tessel {

/// This computer: its desktop entries, the icons of its theme.
class HostMachine final : public Machine {
public:
    /// The services must outlive it.
    HostMachine(std::string id, std::string name, platform::LaunchServices& launching)
        : Machine(std::move(id), std::move(name))
        , m_launching(launching) {}

    std::optional<Catalogue> readCatalogue() override;
    plist::Value readIcon(const std::string& icon) override;
    /// The program becomes a child of nobody: it outlives us.
    void launch(const CatalogueItem& item, LaunchHandler done) override;
    /// Needs GLib's default main context to run.
    std::unique_ptr<platform::Handle> watch(std::function<void()> changed) override;

private:
    platform::LaunchServices& m_launching;
    ThemeIcons m_icons;                                            ///< of the worker thread
    std::shared_ptr<const bool> m_life = std::make_shared<bool>(); ///< ends with us
};

} // namespace tessel
