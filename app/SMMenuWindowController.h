#pragma once

#include "app/SMMenuButton.h"
#include "app/SMMenuCollectionView.h"
#include "app/SMMenuWindow.h"
#include "app/SMMenuWindowOutlets.h"
#include "app/SMMenuWindowOwner.h"
#include "app/menuSearchIndex.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

enum SMMenuState : std::int32_t {
    SMMenuStateHome = 0,
    SMMenuStateSearch = 1,
    SMMenuStateFolder = 2,
};

/// Drives the start menu's window: fills its panes from the application controller's model, keeps the right
/// pane's state, and turns the mouse, the wheel and the keyboard into one highlighted row, scrolling and
/// requests to the main application. A state machine: the window itself is handed in. Main thread only.
class SMMenuWindowController final : public SMMenuWindow, private SMMenuWindowEvents {
public:
    using Services = SMMenuCollectionView::Services;

    /// The owner is borrowed and must outlive the controller.
    SMMenuWindowController(SMMenuWindowOwner& owner, Services services,
                           std::unique_ptr<SMMenuWindowOutlets> outlets);
    ~SMMenuWindowController() override;
    SMMenuWindowController(const SMMenuWindowController&) = delete;
    SMMenuWindowController& operator=(const SMMenuWindowController&) = delete;

    bool isVisible() const override { return m_outlets->isVisible(); }
    KXRect frame() const override { return m_outlets->frame(); }
    void setFrame(KXRect frame) override { m_outlets->setFrame(frame); }
    const void* window() const override { return m_outlets.get(); }

    void reloadData() override;
    void updateWindowHeight() override;
    /// Goes home first from a folder, and from a search that was hidden for more than 30 seconds.
    void showMenuWindow() override;
    void hideMenuWindow() override;

    // The state, for those who watch.
    std::int32_t searchState() const { return m_searchState; }
    SMMenuCollectionView& leftMenuCollectionView() { return m_leftMenuCollectionView; }
    SMMenuCollectionView& rightMenuCollectionView() { return *m_rightMenuCollectionView; }
    const SMMenuButton::Pointer& actionButton() const { return m_actionButton; }
    const SMMenuButton::Pointer& settingsButton() const { return m_settingsButton; }
    const SMMenuButton::Pointer& currentMenuButton() const { return m_currentMenuButton; }
    const SMMenuItem::Pointer& currentMenu() const { return m_currentMenu; }
    const SMMenuButton::Pointer& currentMouseOverMenuButton() const { return m_currentMouseOverMenuButton; }

private:
    struct KeyViewRing;

    // Panes.
    void makeButtons();
    void updateMenuList();
    void updateContents();
    void changeStateTo(std::int32_t state, std::int32_t animation);
    void enterState(std::int32_t actionStyle, const char* actionTitle);
    void updateRightMenuView(std::int32_t animation, std::int32_t style, SMMenuItems items,
                             bool disallowScrolling);
    void forgetCurrentMenu();

    // Choosing.
    void selectMenuItem(const SMMenuItem::Pointer& item, const SMMenuButton::Pointer& button);
    void openFolder(const SMMenuItem::Pointer& folder, const SMMenuButton::Pointer& button);
    void onActionButton();
    void onSettingsButton();

    // Highlight.
    KXRect frameInWindow(const SMMenuButton& button) const;
    SMMenuButton::Pointer buttonAt(KXPoint point) const;
    void updateMouseOverState(KXPoint point);
    void changeMouseOverButtonTo(const SMMenuButton::Pointer& button);
    void onMenuCollectionViewDidUpdate(const void* list);

    // Search and keyboard.
    std::string searchText() const;
    void tellResultCount();
    const MenuSearchIndex& searchIndex();
    SMMenuItems filterAppListWithSearchText(const std::string& text);
    KeyViewRing keyViewRing() const;
    bool moveMouseOver(SMEditingCommand command);
    SMMenuButton::Pointer startOfWalk(SMEditingCommand command) const;
    SMMenuButton::Pointer rowBeside(SMMenuArea area) const;
    SMMenuButton::Pointer walk(SMMenuButton::Pointer candidate, bool upward);
    SMMenuCollectionView* listOf(const SMMenuButton& button);

    void viewWillDraw() override;
    void mouseMoved(KXPoint point) override;
    void mouseExited() override { changeMouseOverButtonTo(nullptr); }
    void mouseDown(KXPoint point) override;
    void mouseUp(KXPoint point) override;
    void scrollWheel(double deltaY, KXPoint point) override;
    void controlTextDidChange() override;
    bool doCommandBySelector(SMEditingCommand command) override;
    void flagsChanged(bool optionDown) override;
    void onVMListPopUpButton() override;
    void onCloseShortcut() override { m_owner.closeMenuWindow(); }
    void onSettingsShortcut() override { onSettingsButton(); }
    void windowDidResignKey() override;

    SMMenuWindowOwner& m_owner;
    Services m_services;
    std::unique_ptr<SMMenuWindowOutlets> m_outlets;
    SMMenuCollectionView m_leftMenuCollectionView;
    std::unique_ptr<SMMenuCollectionView> m_rightMenuCollectionView;
    SMMenuButton::Pointer m_settingsButton;
    SMMenuButton::Pointer m_actionButton;
    std::int32_t m_searchState = SMMenuStateHome;
    SMMenuButton::Pointer m_currentMenuButton;          ///< of the left pane, while its folder is open
    SMMenuItem::Pointer m_currentMenu;                  ///< the open folder
    SMMenuButton::Pointer m_currentMouseOverMenuButton; ///< under the mouse or the keyboard
    SMMenuButton::Pointer m_pressedButton;
    std::optional<platform::Clock::Instant> m_hideMenuWindowDate;
    bool m_isOptionKeyPressed = false;
    MenuSearchIndex m_searchIndex;
    std::unique_ptr<platform::Handle> m_indexing; ///< null while none is due
};
