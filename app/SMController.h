#pragma once

#include "app/SMMenuProxy.h"
#include "app/SMMenuWindow.h"
#include "app/SMMenuWindowOwner.h"
#include "app/SMStatusItemView.h"
#include "app/menuFontWarmer.h"
#include "platform/MainLoop.h"
#include "platform/StatusBar.h"

#include <functional>
#include <memory>

class KXIPCClient;
class KXWorkspace;

/// What the application controller works on. Everything must outlive it.
struct SMServices {
    platform::StatusBar& systemStatusBar;
    const KXWorkspace& sharedWorkspace;
    std::function<std::unique_ptr<KXIPCClient>()> makeClient;
    /// Makes ready what `makeMenuWindow` would otherwise take several frames for.
    std::function<void(SMMenuWindowOwner&)> prepareMenuWindow;
    std::function<std::unique_ptr<SMMenuWindow>(SMMenuWindowOwner&)> makeMenuWindow;
    /// What is typed until the handle ends waits for whoever has the keyboard then.
    std::function<std::unique_ptr<platform::Handle>()> holdTyping;
    /// Runs `applicationWillTerminate` and ends the process inside the call.
    std::function<void()> terminate;
    platform::MainLoop& mainLoop;
    /// Makes the fonts ready that the menu would show the text in.
    std::function<void(const std::string& text)> prepareFonts;
};

/// The application's delegate: owns the status item, the proxy, the menu window and the menu's contents, and
/// opens and closes the window. One per process. Main thread only.
class SMController final : public SMMenuWindowOwner, public SMMenuProxyDelegate {
public:
    /// The one that exists, or null.
    static SMController* sharedController();

    explicit SMController(SMServices services);
    ~SMController() override;
    SMController(const SMController&) = delete;
    SMController& operator=(const SMController&) = delete;

    // In the order of a process's life.
    void applicationWillFinishLaunching();
    void applicationDidFinishLaunching();
    void applicationDidResignActive() { closeMenuWindow(); }
    void applicationWillTerminate();

    /// Opens the menu, or closes it when it is open.
    void onStatusItemClicked();
    /// Opens the menu; unlike the main application's "show", does nothing when it is open.
    void openMenuWindow();
    /// Safe at any time, also from inside itself: hiding the window takes the keyboard from it, which closes
    /// again.
    void closeMenuWindow() override;

    const SMMenuModel& model() const override { return m_model; }
    void performMenuItemAction(const SMMenuItem& item) override;
    void showMenuSettings() override;
    void selectIndex(std::int32_t index) override;
    KXRect statusItemFrame() const override;

private:
    void onStartMenuUpdate(const plist::Value& menu, std::vector<std::string> nameList,
                           std::int32_t selectedIndex) override;
    void onStartMenuShow() override;
    void onStartMenuHide() override { closeMenuWindow(); }
    void onStartMenuConnectedToServer() override;

    void onMenuWindowDidResignKey(const void* window);
    void prepareForOpening();
    bool isMainAppRunning() const;
    bool isMenuWindowVisible() const { return m_menuWindow && m_menuWindow->isVisible(); }
    void placeMenuWindow();

    SMServices m_services;
    SMMenuModel m_model;
    std::unique_ptr<KXIPCClient> m_sharedClient;
    std::unique_ptr<SMStatusItemView> m_statusItemView;
    std::unique_ptr<platform::StatusItem> m_statusItem;
    std::unique_ptr<SMMenuProxy> m_menuProxy;
    std::unique_ptr<SMMenuWindow> m_menuWindow;      ///< null until the menu first opens
    std::unique_ptr<platform::Handle> m_preparation; ///< null while none is due
    MenuFontWarmer m_fontWarmer;
};
