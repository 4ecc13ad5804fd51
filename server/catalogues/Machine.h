#pragma once

#include "platform/MainLoop.h"
#include "server/catalogues/Catalogue.h"

#include <functional>
#include <memory>
#include <optional>
#include <string>

namespace tessel {

/// A computer whose applications the menu shows: this one, a guest's root directory, a live guest. One class
/// per kind. Reading may take long and runs on the worker thread; launching and watching belong to the main
/// thread.
class Machine {
public:
    virtual ~Machine() = default;

    const std::string& id() const { return m_id; }     ///< of one word, without '/'; never changes
    const std::string& name() const { return m_name; } ///< for people

    /// Reads the catalogue. Worker thread; never while another reading of this machine runs. Nothing when it
    /// cannot be read, which is logged.
    virtual std::optional<Catalogue> readCatalogue() = 0;

    /// The raw icon set of that name, at every size the machine has of those the menu shows; nil when it has
    /// none. Worker thread, after `readCatalogue`.
    virtual plist::Value readIcon(const std::string& icon) = 0;

    /// Starts the application or performs the command. `done` is called once, with the reason when that
    /// failed: on the main thread, perhaps before this returns, and not after the machine is gone. The item
    /// may be gone by then.
    using LaunchHandler = std::function<void(const std::optional<std::string>& failure)>;
    virtual void launch(const CatalogueItem& item, LaunchHandler done) = 0;

    /// Calls `changed` on the main thread when the catalogue may have become another. Null when that cannot
    /// be told.
    [[nodiscard]] virtual std::unique_ptr<platform::Handle> watch(std::function<void()> changed) = 0;

protected:
    Machine(std::string id, std::string name)
        : m_id(std::move(id))
        , m_name(std::move(name)) {}
    Machine(const Machine&) = delete;
    Machine& operator=(const Machine&) = delete;

private:
    std::string m_id;
    std::string m_name;
};

} // namespace tessel
