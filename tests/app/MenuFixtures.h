#pragma once

#include "app/SMMenuItem.h"
#include "app/SMMenuWindowController.h"
#include "platform/ModifierKeys.h"
#include "tests/support/ManualMainLoop.h"

#include <map>
#include <string>
#include <vector>

using Titles = std::vector<std::string>;

struct FakeKeys final : platform::ModifierKeys {
    bool option = false;
    bool isOptionDown() const override { return option; }
};

/// What makes a leaf; `extra` may give it any other key.
inline plist::Value leafInfo(const std::string& title, plist::Dictionary extra = {}) {
    return extra.set("title", title);
}
inline plist::Value folderInfo(const std::string& title, const std::vector<plist::Value>& children) {
    return leafInfo(title, {{"submenuInfoArray", plist::Array(children)}});
}
inline SMMenuItem::Pointer itemTitled(const std::string& title, plist::Dictionary extra = {}) {
    return SMMenuItem::initWithDictionary(leafInfo(title, std::move(extra)));
}
inline SMMenuModel::List listOf(const std::vector<plist::Value>& infos) {
    return SMMenuItem::initWithDictionary(folderInfo("", infos))->submenu();
}
inline SMMenuModel::List listTitled(const Titles& titles) {
    std::vector<plist::Value> infos;
    for (const auto& title : titles)
        infos.push_back(leafInfo(title));
    return listOf(infos);
}
inline Titles numbered(const std::string& stem, int count) {
    Titles titles;
    for (int i = 0; i < count; ++i)
        titles.push_back(stem + std::to_string(i));
    return titles;
}

inline Titles titlesOf(const SMMenuItems& items) {
    Titles titles;
    for (const auto& item : items)
        titles.push_back(item->isSeparator() ? "|" : item->title());
    return titles;
}
/// The rows in view, from the top down: "^" and "v" for the arrows, "|" for separators.
inline Titles visibleTitles(const SMMenuCollectionView& list) {
    Titles titles;
    list.forEachVisibleButton([&](const SMMenuButton& button) {
        const bool up = button.style() == SMMenuButtonStyleScrollUp;
        const bool separator = button.menuItem() && button.menuItem()->isSeparator();
        titles.push_back(separator ? "|" : !button.isScrollButton() ? button.title() : up ? "^" : "v");
    });
    return titles;
}

/// The window as a set of rectangles: left list, right box and two buttons in a window 480 wide.
struct FakeOutlets final : SMMenuWindowOutlets {
    SMMenuWindowEvents* events = nullptr;
    bool visible = false;
    KXRect windowFrame{0, 0, 480, 230};
    KXRect screen{0, 0, 1280, 800};
    SMMenuCollectionView* left = nullptr;
    SMMenuCollectionView* right = nullptr;
    std::vector<std::int32_t> animations;
    Titles machines;
    std::int32_t selectedMachine = -1;
    std::string search;
    std::optional<std::size_t> results;
    std::string reported; ///< to assistive technology

    void setDelegate(SMMenuWindowEvents* delegate) override { events = delegate; }
    bool isVisible() const override { return visible; }
    KXRect frame() const override { return windowFrame; }
    void setFrame(const KXRect& frame) override {
        windowFrame = frame;
        if (left) left->setSize(areaFrame(SMMenuArea::leftMenu).size());
        if (right) right->setSize(areaFrame(SMMenuArea::rightMenuBox).size());
    }
    KXRect visibleScreenFrame() const override { return screen; }
    void makeKeyAndOrderFront() override { visible = true; }
    void orderOut() override {
        if (std::exchange(visible, false)) events->windowDidResignKey();
    }
    void setNeedsDisplay() override {}
    KXRect areaFrame(SMMenuArea area) const override {
        const float height = windowFrame.height;
        const std::map<SMMenuArea, KXRect> frames = {
            {SMMenuArea::leftMenu, {0, 40, 170, height - 90}},
            {SMMenuArea::rightMenuBox, {180, 10, 290, height - 80}},
            {SMMenuArea::settingsButton, {6, 10, 150, 20}},
            {SMMenuArea::actionButton, {180, height - 70, 290, 20}},
        };
        return frames.at(area);
    }
    void setButton(SMMenuArea, SMMenuButton*) override {}
    void setLeftList(SMMenuCollectionView* list) override {
        left = list;
        setFrame(windowFrame);
    }
    void setRightList(SMMenuCollectionView* list, std::int32_t animation) override {
        right = list;
        animations.push_back(animation);
    }
    void setVMList(const Titles& names) override {
        machines = names;
        selectedMachine = names.empty() ? -1 : 0;
    }
    void selectVM(std::int32_t index) override { selectedMachine = index; }
    std::int32_t indexOfSelectedVM() const override { return selectedMachine; }
    std::string searchString() const override { return search; }
    void setSearchString(const std::string& text) override { search = text; }
    void setResultCount(std::optional<std::size_t> count) override { results = count; }
    void didHighlightByKeyboard(const SMMenuButton& button) override { reported = button.title(); }
};

struct FakeOwner final : SMMenuWindowOwner {
    SMMenuModel contents;
    SMMenuWindow* window = nullptr;
    Titles log;
    const SMMenuModel& model() const override { return contents; }
    void performMenuItemAction(const SMMenuItem& item) override { log.push_back("action " + item.title()); }
    void showMenuSettings() override { log.push_back("settings"); }
    void selectIndex(std::int32_t index) override { log.push_back("select " + std::to_string(index)); }
    void closeMenuWindow() override {
        log.push_back("close");
        if (window) window->hideMenuWindow();
    }
    KXRect statusItemFrame() const override { return {}; }
};

/// A controller over fakes, with what the window would do to it.
struct MenuWorld {
    FakeKeys keys;
    ManualMainLoop loop;
    FakeOwner owner;
    FakeOutlets* outlets = nullptr;
    std::unique_ptr<SMMenuWindowController> menu;

    void open() {
        auto made = std::make_unique<FakeOutlets>();
        outlets = made.get();
        menu = std::make_unique<SMMenuWindowController>(
            owner, SMMenuWindowController::Services{loop.clock(), loop, keys}, std::move(made));
        owner.window = menu.get();
        menu->showMenuWindow();
        display();
    }
    void display() { outlets->events->viewWillDraw(); }
    void type(const std::string& text) {
        outlets->search = text;
        outlets->events->controlTextDidChange();
        display();
    }
    bool press(SMEditingCommand command) {
        const bool handled = outlets->events->doCommandBySelector(command);
        display();
        return handled;
    }
    KXPoint centerOf(const std::string& title) const {
        const std::pair<SMMenuArea, SMMenuCollectionView*> lists[] = {
            {SMMenuArea::leftMenu, outlets->left}, {SMMenuArea::rightMenuBox, outlets->right}};
        KXPoint center{-1, -1};
        for (const auto& [area, list] : lists) {
            const KXRect place = outlets->areaFrame(area);
            list->forEachVisibleButton([&](const SMMenuButton& button) {
                if (button.title() != title) return;
                const KXRect& row = button.frame();
                center = {place.x + row.x + row.width / 2, place.y + row.y + row.height / 2};
            });
        }
        return center;
    }
    void click(KXPoint point) {
        outlets->events->mouseDown(point);
        outlets->events->mouseUp(point);
        display();
    }
    void click(const std::string& title) { click(centerOf(title)); }
    void clickAction() {
        const KXRect place = outlets->areaFrame(SMMenuArea::actionButton);
        click(KXPoint{place.x + 5, place.y + 5});
    }
    std::string highlighted() const {
        const auto& button = menu->currentMouseOverMenuButton();
        return button ? button->title() : "none";
    }
    Titles rightTitles() const { return titlesOf(outlets->right->menuItems()); }
};
