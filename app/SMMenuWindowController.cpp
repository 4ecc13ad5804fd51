#include "app/SMMenuWindowController.h"

#include "app/SMMenuButton.h"
#include "app/SMMenuCollectionView.h"
#include "app/SMMenuItem.h"
#include "app/SMMenuModel.h"
#include "app/SMMenuWindow.h"
#include "app/SMMenuWindowOutlets.h"
#include "app/SMMenuWindowOwner.h"
#include "app/menuHomeList.h"
#include "app/menuRow.h"
#include "lib/base/Geometry.h"
#include "lib/base/IsEqual.h"
#include "lib/base/KXNotificationCenter.h"
#include "platform/MainLoop.h"

#include <QCoreApplication>
#include <any>
#include <chrono>
#include <cstdint>
#include <memory>
#include <string>
#include <utility>

namespace {

constexpr std::chrono::seconds searchSurvivesHiding{30};

std::string localized(const char* text) {
    return QCoreApplication::translate("SMMenuWindowController", text).toStdString();
}

void append(SMMenuItems& items, const SMMenuModel::List& list) {
    if (list) items.insert(items.end(), list->begin(), list->end());
}

} // namespace

SMMenuWindowController::SMMenuWindowController(SMMenuWindowOwner& owner, Services services,
                                               std::unique_ptr<SMMenuWindowOutlets> outlets)
    : m_owner(owner)
    , m_services(services)
    , m_outlets(std::move(outlets))
    , m_leftMenuCollectionView(services) {
    m_outlets->setDelegate(this);
    KXNotificationCenter::defaultCenter().addObserver(
        this, SMMenuCollectionViewDidUpdateNotification, nullptr, [this](const KXNotification& notification) {
            onMenuCollectionViewDidUpdate(std::any_cast<const void*>(notification.object));
        });
    makeButtons();
    m_outlets->setLeftList(&m_leftMenuCollectionView);
    updateMenuList();
    updateContents();
    updateWindowHeight();
    changeStateTo(SMMenuStateHome, SMMenuAnimationNone);
}

SMMenuWindowController::~SMMenuWindowController() {
    KXNotificationCenter::defaultCenter().removeObserver(this);
    m_outlets->setDelegate(nullptr);
    m_outlets->setLeftList(nullptr);
    m_outlets->setRightList(nullptr, SMMenuAnimationNone);
    m_outlets->setButton(SMMenuArea::settingsButton, nullptr);
    m_outlets->setButton(SMMenuArea::actionButton, nullptr);
}

void SMMenuWindowController::makeButtons() {
    const auto make = [this](SMMenuArea area, std::int32_t style, SMMenuButton::Action action) {
        auto button = std::make_shared<SMMenuButton>(m_services.modifierKeys);
        button->setStyle(style);
        button->setAction(std::make_shared<const SMMenuButton::Action>(std::move(action)));
        m_outlets->setButton(area, button.get());
        return button;
    };
    m_settingsButton = make(SMMenuArea::settingsButton, SMMenuButtonStyleList,
                            [this](SMMenuButton&) { onSettingsButton(); });
    m_settingsButton->setTitle(localized(QT_TRANSLATE_NOOP("SMMenuWindowController", "Menu Settings…")));
    m_actionButton = make(SMMenuArea::actionButton, SMMenuButtonStyleAllPrograms,
                          [this](SMMenuButton&) { onActionButton(); });
}

// Panes.

void SMMenuWindowController::reloadData() {
    m_currentMenuButton = nullptr;
    m_currentMenu = nullptr;
    changeMouseOverButtonTo(nullptr);
    updateMenuList();
    updateContents();
    changeStateTo(m_searchState, SMMenuAnimationNone);
}

void SMMenuWindowController::updateWindowHeight() {
    KXRect frame = m_outlets->frame();
    const float box = m_outlets->areaFrame(SMMenuArea::rightMenuBox).height;
    frame.height = menuWindowHeight(frame.height, box, m_outlets->visibleScreenFrame().height);
    m_outlets->setFrame(frame);
}

void SMMenuWindowController::updateMenuList() {
    m_outlets->setVMList(m_owner.model().nameList);
    if (m_owner.model().selectedIndex != -1) m_outlets->selectVM(m_owner.model().selectedIndex);
}

void SMMenuWindowController::updateContents() {
    SMMenuItems items;
    append(items, m_owner.model().topMenu);
    items.push_back(SMMenuItem::flexibleSpaceItem());
    append(items, m_owner.model().bottomMenu);
    m_leftMenuCollectionView.setAction(
        [this](SMMenuButton& sender) { selectMenuItem(sender.menuItem(), sender.shared_from_this()); });
    m_leftMenuCollectionView.setStyle(SMMenuButtonStyleLeftPane);
    m_leftMenuCollectionView.setDisallowScrolling(true);
    m_leftMenuCollectionView.setMenuItems(std::move(items));
    if (m_searchIndex.items() == m_owner.model().searchableApps) return;
    // After this turn, but not as late as the first key: folding thousands of titles takes half a frame.
    using Milliseconds = platform::MainLoop::Milliseconds;
    m_indexing = m_services.mainLoop.startTimer(Milliseconds{0}, Milliseconds{0}, [this] { searchIndex(); });
}

void SMMenuWindowController::forgetCurrentMenu() {
    if (m_currentMenuButton) m_currentMenuButton->setHighlighted(false);
    m_currentMenuButton = nullptr;
    m_currentMenu = nullptr;
}

void SMMenuWindowController::enterState(std::int32_t actionStyle, const char* actionTitle) {
    m_actionButton->setStyle(actionStyle);
    m_actionButton->setTitle(localized(actionTitle));
}

void SMMenuWindowController::changeStateTo(std::int32_t state, std::int32_t animation) {
    constexpr const char* back = QT_TRANSLATE_NOOP("SMMenuWindowController", "Back");
    constexpr const char* allPrograms = QT_TRANSLATE_NOOP("SMMenuWindowController", "All Programs");
    m_searchState = state;
    switch (state) {
    case SMMenuStateHome: {
        enterState(SMMenuButtonStyleAllPrograms, allPrograms);
        m_outlets->setSearchString({});
        const float room = m_outlets->areaFrame(SMMenuArea::rightMenuBox).height;
        updateRightMenuView(animation, SMMenuButtonStyleHome,
                            pinnedAndFrequentlyUsedApps(m_owner.model(), room), true);
        forgetCurrentMenu();
        break;
    }
    case SMMenuStateSearch:
        enterState(SMMenuButtonStyleBack, back);
        updateRightMenuView(animation, SMMenuButtonStyleList, filterAppListWithSearchText(searchText()),
                            false);
        forgetCurrentMenu();
        break;
    case SMMenuStateFolder: {
        enterState(SMMenuButtonStyleBack, back);
        m_outlets->setSearchString({});
        const bool hasItems = m_currentMenu && m_currentMenu->submenu();
        updateRightMenuView(animation, SMMenuButtonStyleList,
                            hasItems ? *m_currentMenu->submenu() : SMMenuItems(), false);
        break;
    }
    default:
        break;
    }
}

void SMMenuWindowController::updateRightMenuView(std::int32_t animation, std::int32_t style,
                                                 SMMenuItems items, bool disallowScrolling) {
    auto list = std::make_unique<SMMenuCollectionView>(m_services);
    list->setAction(
        [this](SMMenuButton& sender) { selectMenuItem(sender.menuItem(), sender.shared_from_this()); });
    list->setStyle(style);
    list->setDisallowScrolling(disallowScrolling);
    list->setShowTopSeparator(true);
    list->setSize(m_outlets->areaFrame(SMMenuArea::rightMenuBox).size());
    list->setMenuItems(std::move(items));
    m_outlets->setRightList(list.get(), m_rightMenuCollectionView ? animation : SMMenuAnimationNone);
    m_rightMenuCollectionView = std::move(list);
    tellResultCount();
}

void SMMenuWindowController::showMenuWindow() {
    changeMouseOverButtonTo(nullptr);
    const bool hiddenForLong =
        m_hideMenuWindowDate && m_services.clock.now() - *m_hideMenuWindowDate > searchSurvivesHiding;
    if ((m_searchState == SMMenuStateSearch && hiddenForLong) || m_searchState == SMMenuStateFolder)
        changeStateTo(SMMenuStateHome, SMMenuAnimationNone);
    m_outlets->makeKeyAndOrderFront();
}

void SMMenuWindowController::hideMenuWindow() {
    m_hideMenuWindowDate = m_services.clock.now();
    m_pressedButton = nullptr;
    m_outlets->orderOut();
}

void SMMenuWindowController::windowDidResignKey() {
    KXNotificationCenter::defaultCenter().postNotification(SMWindowDidResignKeyNotification, window());
}

void SMMenuWindowController::viewWillDraw() {
    // Events call this too: each finds what the one before it led to, though that may not have been painted
    // yet.
    m_leftMenuCollectionView.viewWillDraw();
    m_rightMenuCollectionView->viewWillDraw();
}

// Choosing.

void SMMenuWindowController::selectMenuItem(const SMMenuItem::Pointer& item,
                                            const SMMenuButton::Pointer& button) {
    if (item && item->submenu()) {
        openFolder(item, button);
        return;
    }
    forgetCurrentMenu();
    if (!item) {
        changeStateTo(SMMenuStateHome, SMMenuAnimationBack);
        return;
    }
    m_owner.performMenuItemAction(*item);
    m_owner.closeMenuWindow();
}

void SMMenuWindowController::openFolder(const SMMenuItem::Pointer& folder,
                                        const SMMenuButton::Pointer& button) {
    if (KXIsEqual(m_currentMenuButton, button)) {
        selectMenuItem(nullptr, nullptr);
        return;
    }
    if (m_currentMenu && m_currentMenu->hasChildItem(folder.get())) {
        SMMenuCollectionView& list = *m_rightMenuCollectionView;
        if (KXIsEqual(list.expandedMenuItem(), folder)) {
            list.setExpandedMenuItem(folder->parent());
            return;
        }
        list.setExpandedMenuItem(folder);
        list.scrollItemToVisible(folder.get());
        return;
    }
    if (m_currentMenuButton) m_currentMenuButton->setHighlighted(false);
    if (button && m_leftMenuCollectionView.isSuperviewOf(*button)) {
        m_currentMenuButton = button;
        m_currentMenuButton->setHighlighted(true);
    }
    m_currentMenu = folder;
    changeStateTo(SMMenuStateFolder, SMMenuAnimationForward);
}

void SMMenuWindowController::onActionButton() {
    switch (m_searchState) {
    case SMMenuStateHome:
        selectMenuItem(m_owner.model().allProgramsMenu, nullptr);
        break;
    case SMMenuStateSearch:
        selectMenuItem(nullptr, nullptr);
        break;
    case SMMenuStateFolder:
        selectMenuItem(m_currentMenu ? m_currentMenu->parent() : nullptr, nullptr);
        break;
    default:
        break;
    }
}

void SMMenuWindowController::onSettingsButton() {
    m_owner.showMenuSettings();
    m_owner.closeMenuWindow();
}

void SMMenuWindowController::onVMListPopUpButton() {
    const std::int32_t index = m_outlets->indexOfSelectedVM();
    changeStateTo(SMMenuStateHome, SMMenuAnimationNone);
    m_owner.selectIndex(index);
}
