#include "server/catalogues/MenuBuilder.h"

#include <gmock/gmock.h>

using namespace tessel;
using testing::ElementsAre;

namespace {

CatalogueItem application(const std::string& id, const std::string& icon = "") {
    return {.id = id, .title = "The " + id, .icon = icon};
}

CatalogueItem folder(const std::string& name, std::vector<CatalogueItem> children) {
    return {.kind = ItemKind::folder, .id = name, .title = name, .children = std::move(children)};
}

Catalogue smallCatalogue() {
    CatalogueItem checked = application("checked", "own");
    checked.state = 2;
    checked.alternate = {application("other")};
    CatalogueItem disabled = application("disabled");
    disabled.enabled = false;
    CatalogueItem outer = folder("Outer", {checked, folder("Inner", {application("deep"), disabled})});
    outer.hideTriangle = true;
    return {.programs = {application("web", "unknown"), {.kind = ItemKind::separator}, outer},
            .topMenu = {{.kind = ItemKind::command, .id = "top/a/b", .title = "Command"}, application("web")},
            .bottomMenu = {},
            .pinned = {"deep", "gone"},
            .frequent = {"disabled", "deep", "web", "checked"},
            .genericIcon = "generic"};
}

/// All that a row holds but its title, action and icons, in a line.
std::string text(const plist::Value& row) {
    std::string result;
    for (std::size_t i = 0; i < row.size(); ++i) {
        const std::string key = row.keyAt(i);
        const plist::Value value = row.at(i);
        if (key == "title") result += value.stringOr("");
        if (key == "action") result += " " + value.stringOr("") + row["representedObject"].stringOr("");
        if (key == "rawIcons") result += " icon " + value.at(0).stringOr("");
        if (key == "altMenuItem") result += " or {" + text(value) + "}";
        if (value.isNumber()) result += " " + key + " " + std::to_string(value.intValue());
    }
    return result;
}

std::vector<std::string> texts(const plist::Value& rows) {
    std::vector<std::string> result;
    for (const plist::Value& row : rows)
        result.push_back(text(row));
    return result;
}

} // namespace

TEST(MenuBuilder, BuildsEveryListOfTheMenu) {
    const Catalogue catalogue = smallCatalogue();
    const IconSets icons{{"own", plist::Array{"own"}}, {"generic", plist::Array{"any"}}};
    const plist::Value menu = BuildMenu({"here", catalogue, icons, {}});
    const std::string web = "The web launchApplication:here/web icon any";
    const std::string other = "The other launchApplication:here/other icon any";
    const std::string rest = " icon own or {" + other + "}";
    const std::string unmarked = "The checked launchApplication:here/checked" + rest;
    const std::string checked = "The checked launchApplication:here/checked itemState 2" + rest;
    const std::string deep = "The deep launchApplication:here/deep icon any";
    const std::string disabled = "The disabled launchApplication:here/disabled enabled 0 icon any";
    EXPECT_THAT(texts(menu["topMenu"]), ElementsAre("Command performCommand:here/top/a/b", web));
    EXPECT_EQ(menu["bottomMenu"], plist::Value(plist::Array{}));
    EXPECT_THAT(texts(menu["pinnedApps"]), ElementsAre(deep));
    EXPECT_THAT(texts(menu["frequentlyUsedApps"]), ElementsAre(web, checked));
    EXPECT_THAT(texts(menu["searchableApps"]), ElementsAre(web, unmarked, deep, disabled));
    const plist::Value programs = menu["allPrograms"];
    EXPECT_THAT(texts(programs), ElementsAre(web, " separatorItem 1", "Outer hideTriangle 1"));
    EXPECT_THAT(texts(programs.at(2)["submenuInfoArray"]), ElementsAre(checked, "Inner"));
    EXPECT_THAT(texts(programs.at(2)["submenuInfoArray"].at(1)["submenuInfoArray"]),
                ElementsAre(deep, disabled));
}

TEST(MenuBuilder, PutsTheMostLaunchedFirst) {
    const LaunchCounts launches{{"checked", 1},  {"web", 3},     {"deep", 9},
                                {"disabled", 9}, {"top/a/b", 9}, {"x", 9}};
    EXPECT_THAT(FrequentlyUsed(smallCatalogue(), launches), ElementsAre("web", "checked"));
    EXPECT_THAT(FrequentlyUsed(smallCatalogue(), {{"checked", 1}}), ElementsAre("checked", "web"));
}

TEST(MenuBuilder, LooksUpWhatComesBack) {
    EXPECT_EQ(ParseToken("here/top/a/b").machine, "here");
    EXPECT_EQ(ParseToken("here/top/a/b").item, "top/a/b");
    const Catalogue catalogue = smallCatalogue();
    const CatalogueIndex index(catalogue);
    const auto find = [&](const char* id, const char* action) {
        std::string refusal;
        const auto* item = FindItemForAction(index, id, plist::Dictionary{{"action", action}}, refusal);
        return item ? item->title : refusal;
    };
    EXPECT_EQ(find("deep", "launchApplication:"), "The deep");
    EXPECT_EQ(find("other", "launchApplication:"), "The other");
    EXPECT_EQ(find("top/a/b", "performCommand:"), "Command");
    EXPECT_EQ(find("top/a/b", "launchApplication:"), "not the item's action");
    EXPECT_EQ(find("disabled", "launchApplication:"), "the item is disabled");
    EXPECT_EQ(find("Outer", ""), "a folder has no action");
    EXPECT_EQ(find("", ""), "no such item");
    EXPECT_EQ(find("../web", "launchApplication:"), "no such item");
}
