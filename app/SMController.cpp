#include "app/SMController.h"

#include "app/SMMenuItem.h"
#include "app/SMMenuModel.h"
#include "app/SMMenuProxy.h"
#include "app/SMMenuWindow.h"
#include "app/SMStatusItemView.h"
#include "app/menuMirroring.h"
#include "lib/base/Geometry.h"
#include "lib/base/KXNotificationCenter.h"
#include "lib/ipc/KXIPCClient.h"
#include "lib/kxAppKit/system/KXWorkspace.h"
#include "lib/plist/Value.h"
#include "platform/MainLoop.h"

#include <any>
#include <cstdint>
#include <memory>
#include <string_view>
#include <utility>
#include <vector>

namespace {

constexpr std::string_view mainAppBundleIdentifiers[] = {"com.corvane.tessel", "com.corvane.tesselDaemon"};

SMController* theController = nullptr; // NOLINT(*-avoid-non-const-global-variables): the one that exists

/// Null when the dictionary held no array; elements of any type become items.
SMMenuModel::List itemsForArray(const plist::Value& array) {
    if (!array.isArray()) return nullptr;
    auto items = std::make_shared<SMMenuItems>();
    items->reserve(array.size());
    for (const auto& info : array)
        items->push_back(SMMenuItem::initWithDictionary(info));
    return items;
}

} // namespace

SMController* SMController::sharedController() {
    return theController;
}

SMController::SMController(SMServices services)
    : m_services(std::move(services))
    , m_fontWarmer({.mainLoop = m_services.mainLoop,
                    .isMenuHidden = [this] { return !isMenuWindowVisible(); },
                    .shape = m_services.prepareFonts}) {
    theController = this;
}

SMController::~SMController() {
    applicationWillTerminate();
    theController = nullptr;
}

void SMController::applicationWillFinishLaunching() {
    m_sharedClient = m_services.makeClient();
    m_sharedClient->setAllowIncomingMessages(true);
}

void SMController::applicationDidFinishLaunching() {
    m_statusItemView = std::make_unique<SMStatusItemView>(m_services.systemStatusBar.thickness());
    m_statusItemView->setAction([this](SMStatusItemView&) { onStatusItemClicked(); });
    m_statusItem = m_services.systemStatusBar.addItem(m_statusItemView->frameSize().width, *m_statusItemView);
    m_statusItemView->setStatusItem(m_statusItem.get());
    m_menuProxy = std::make_unique<SMMenuProxy>(*this, *m_sharedClient);
    m_menuProxy->connect();
    KXNotificationCenter::defaultCenter().addObserver(
        this, SMWindowDidResignKeyNotification, nullptr, [this](const KXNotification& notification) {
            onMenuWindowDidResignKey(std::any_cast<const void*>(notification.object));
        });
    using Milliseconds = platform::MainLoop::Milliseconds;
    m_preparation =
        m_services.mainLoop.startTimer(Milliseconds{0}, Milliseconds{0}, [this] { prepareForOpening(); });
}

void SMController::prepareForOpening() {
    m_preparation.reset();
    if (m_menuWindow) return;
    isMainAppRunning(); // whatever the answer is: to be quick when a click asks
    m_services.prepareMenuWindow(*this);
}

void SMController::applicationWillTerminate() {
    m_preparation.reset();
    KXNotificationCenter::defaultCenter().removeObserver(this);
    if (m_menuProxy) m_menuProxy->disconnect();
    m_menuProxy.reset();
    if (m_statusItemView) m_statusItemView->setStatusItem(nullptr);
    m_statusItem.reset();
    m_statusItemView.reset();
    if (m_sharedClient) m_sharedClient->terminateWithDelegate({});
    m_sharedClient.reset();
}

void SMController::onStatusItemClicked() {
    const auto typing = m_services.holdTyping(); // however long this takes, no letter is lost
    if (!isMainAppRunning()) m_services.terminate();
    if (isMenuWindowVisible()) {
        closeMenuWindow();
        return;
    }
    if (m_menuWindow)
        m_menuWindow->reloadData();
    else
        m_menuWindow = m_services.makeMenuWindow(*this);
    m_menuWindow->updateWindowHeight();
    placeMenuWindow();
    m_menuWindow->showMenuWindow();
    // Should terminating have returned, there is neither any more.
    if (m_statusItemView) m_statusItemView->setIsSelected(true);
    if (m_menuProxy) m_menuProxy->refresh();
}

void SMController::openMenuWindow() {
    if (!isMenuWindowVisible()) onStatusItemClicked();
}

void SMController::placeMenuWindow() {
    const KXRect item = statusItemFrame();
    const KXRect window = m_menuWindow->frame();
    // One point past the item's right edge, and not held to the screen: the window server sees to that.
    KXRect place{item.width - window.width + 1, item.y - window.height, window.width, window.height};
    if (menuIsMirrored()) place = menuMirrored(place, item.width);
    place.x += item.x;
    m_menuWindow->setFrame(place);
}

void SMController::closeMenuWindow() {
    if (m_statusItemView) m_statusItemView->setIsSelected(false);
    // Also when it is hidden already: every call stamps the time of hiding.
    if (m_menuWindow) m_menuWindow->hideMenuWindow();
    m_fontWarmer.resume();
}

void SMController::onMenuWindowDidResignKey(const void* window) {
    if (m_menuWindow && m_menuWindow->window() == window) closeMenuWindow();
}

bool SMController::isMainAppRunning() const {
    return m_services.sharedWorkspace.isAppWithBundleIdentifierRunning(mainAppBundleIdentifiers);
}

void SMController::performMenuItemAction(const SMMenuItem& item) {
    if (m_menuProxy) m_menuProxy->performMenuItemAction(item);
}

void SMController::showMenuSettings() {
    if (m_menuProxy) m_menuProxy->showMenuSettings();
}

void SMController::selectIndex(std::int32_t index) {
    if (m_menuProxy) m_menuProxy->selectIndex(index);
}

KXRect SMController::statusItemFrame() const {
    return m_statusItem ? m_statusItem->frame() : KXRect{};
}

void SMController::onStartMenuUpdate(const plist::Value& menu, std::vector<std::string> nameList,
                                     std::int32_t selectedIndex) {
    m_model.nameList = std::move(nameList);
    m_model.selectedIndex = selectedIndex;
    m_model.topMenu = itemsForArray(menu["topMenu"]);
    m_model.bottomMenu = itemsForArray(menu["bottomMenu"]);
    m_model.pinnedApps = itemsForArray(menu["pinnedApps"]);
    m_model.frequentlyUsedApps = itemsForArray(menu["frequentlyUsedApps"]);
    m_model.searchableApps = itemsForArray(menu["searchableApps"]);
    const auto allPrograms = itemsForArray(menu["allPrograms"]);
    m_model.allProgramsMenu = allPrograms ? SMMenuItem::initWithSubmenu(*allPrograms) : nullptr;
    if (m_menuWindow) m_menuWindow->reloadData();
    m_fontWarmer.take(m_model);
}

void SMController::onStartMenuShow() {
    // A toggle: a "show" that always showed would look right and is wrong.
    onStatusItemClicked();
}

void SMController::onStartMenuConnectedToServer() {
    if (isMenuWindowVisible()) m_menuProxy->refresh();
}
