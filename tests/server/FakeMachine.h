#pragma once

#include "server/catalogues/Machine.h"

#include <map>

/// A machine whose contents a test sets.
class FakeMachine final : public tessel::Machine {
public:
    explicit FakeMachine(const std::string& id)
        : Machine(id, "Machine " + id) {
        setApplications(
            {{.id = "a", .title = id + "'s a", .icon = "red"}, {.id = "b", .title = "b", .icon = "red"}});
    }
    void setApplications(std::vector<tessel::CatalogueItem> applications) {
        content.emplace().programs = std::move(applications);
    }

    std::optional<tessel::Catalogue> readCatalogue() override {
        ++readings;
        return content;
    }
    plist::Value readIcon(const std::string& icon) override {
        iconsAsked.push_back(icon);
        return icons[icon];
    }
    void launch(const tessel::CatalogueItem& item, LaunchHandler done) override {
        launched.push_back(item.id);
        done(failure);
    }
    std::unique_ptr<platform::Handle> watch(std::function<void()> handler) override {
        changed = std::move(handler);
        return nullptr;
    }

    std::optional<tessel::Catalogue> content; ///< none: cannot be read
    tessel::IconSets icons{{"red", plist::Array{1}}};
    std::optional<std::string> failure; ///< of launching
    int readings = 0;
    std::vector<std::string> iconsAsked, launched;
    std::function<void()> changed;
};
