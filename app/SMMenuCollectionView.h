#pragma once

#include "app/SMMenuButton.h"
#include "app/menuListLayout.h"
#include "platform/Clock.h"
#include "platform/MainLoop.h"
#include "platform/ModifierKeys.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <vector>

/// Posted with the list as object at the end of every layout, also when nothing changed.
inline constexpr const char* SMMenuCollectionViewDidUpdateNotification =
    "SM_MENU_COLLECTION_VIEW_DID_UPDATE_NOTIFICATION";

/// A vertical list of rows made from items: unfolds the folders that lead to one of them in place, scrolls by
/// arrows that take the place of rows, and gives spare height to flexible spaces. Laid out at the next
/// display, or by `performLayout`. y grows upwards, the list's lower left corner is (0, 0). Main thread only.
class SMMenuCollectionView final : private SMMenuButton::Superview {
public:
    struct Services {
        const platform::Clock& clock;
        platform::MainLoop& mainLoop;
        const platform::ModifierKeys& modifierKeys;
    };

    /// What shows the list.
    class Host {
    public:
        /// `area` is in the list's coordinates.
        virtual void setNeedsDisplay(const KXRect& area) = 0;

    protected:
        ~Host() = default;
    };

    explicit SMMenuCollectionView(Services services);
    ~SMMenuCollectionView();
    SMMenuCollectionView(const SMMenuCollectionView&) = delete;
    SMMenuCollectionView& operator=(const SMMenuCollectionView&) = delete;

    /// Borrowed; null for none.
    void setHost(Host* host) { m_host = host; }
    KXSize size() const { return m_size; }
    void setSize(KXSize size);

    const SMMenuItems& menuItems() const { return m_menuItems; }
    void setMenuItems(SMMenuItems items);
    const SMMenuItem::Pointer& expandedMenuItem() const { return m_expandedMenuItem; }
    void setExpandedMenuItem(SMMenuItem::Pointer item);

    // These take effect with the next rows or the next layout.
    void setAction(SMMenuButton::Action action);
    void setStyle(std::int32_t style) { m_style = style; }
    std::int32_t style() const { return m_style; }
    void setDisallowScrolling(bool disallow) { m_disallowScrolling = disallow; }
    bool disallowScrolling() const { return m_disallowScrolling; }
    void setShowTopSeparator(bool show) { m_showTopSeparator = show; }

    bool needsLayout() const { return m_needsLayout; }
    void setNeedsLayout(bool needsLayout);
    /// To be called before the list is painted.
    void viewWillDraw();
    void performLayout();

    /// All rows in display order, the separator and the arrows among them. Empty until the first layout.
    const std::vector<SMMenuButton::Pointer>& menuButtons() const { return m_menuButtons; }
    bool isSuperviewOf(const SMMenuButton& button) const { return button.superview() == this; }
    const SMMenuButton::Pointer& scrollUpMenuButton() const { return m_scrollUpMenuButton; }
    const SMMenuButton::Pointer& scrollDownMenuButton() const { return m_scrollDownMenuButton; }
    const SMMenuButton::Pointer& topSeparatorButton() const { return m_topSeparatorButton; }
    std::size_t scrollIndex() const { return m_scrollIndex; }

    /// Null for no item and for one that no row shows.
    SMMenuButton::Pointer findButtonForMenuItem(const SMMenuItem* item) const;
    /// The row that is not hidden and holds the point; null for none.
    SMMenuButton::Pointer buttonAt(KXPoint point) const;
    /// Calls `visit` for every row that is not hidden, from the top down.
    template <typename Visitor>
    void forEachVisibleButton(Visitor visit) const {
        for (std::size_t i = m_firstVisible; i < m_endVisible; ++i)
            if (!m_menuButtons[i]->isHidden()) visit(*m_menuButtons[i]);
    }

    /// False when the list does not scroll further that way.
    bool scrollUp();
    bool scrollDown();
    /// The item's row if it can be brought into view, else null. Lays out once, however far it is.
    SMMenuButton::Pointer scrollItemToVisible(const SMMenuItem* item);

    std::optional<platform::Clock::Instant> delayedScrollTimerFireDate() const { return m_delayedFireDate; }
    /// Holds scrolling by hovering back until then.
    void setDelayedScrollTimerFireDate(std::optional<platform::Clock::Instant> date);
    bool isScrollTimerValid() const { return m_scrollTimer != nullptr; }

    /// A row beside the list, and the height of its centre in the list's coordinates.
    struct Neighbour {
        SMMenuButton::Pointer button;
        float y = 0;
    };
    /// The row to move to when the keyboard enters the list at height `y`: the nearer of the nearest above
    /// and the nearest below, where neighbours in the key-view ring count too. Null for none.
    SMMenuButton::Pointer findValidKeyViewNearYPos(float y, const Neighbour& previous,
                                                   const Neighbour& next) const;

private:
    struct ScrollTimer {
        bool up;
        platform::Clock::Instant fireDate;
        std::unique_ptr<platform::Handle> handle;
    };

    void setNeedsDisplay(const SMMenuButton& button) override;
    void resetAll();
    void addMenuButtons(const SMMenuItems& items, std::int32_t indentation);
    SMMenuButton::Pointer makeButton(std::int32_t style);
    /// Makes the rows anew if they must be; the extra ones are out afterwards.
    void makeButtons();
    void takeOutExtraButtons();
    std::vector<SMMenuButton::Pointer>::const_iterator findRow(const SMMenuItem* item) const;
    void insertExtraButton(const SMMenuButton::Pointer& button, std::optional<std::size_t> index);
    std::vector<MenuListRow> rows() const;
    MenuListState layoutState() const;
    void placeButtons(const std::vector<MenuRowPlace>& places);

    void onScrollButton(SMMenuButton& sender);
    void onScrollTimer();
    void startScrollTimer(bool up, platform::Clock::Instant fireDate);

    Services m_services;
    Host* m_host = nullptr;
    KXSize m_size;
    SMMenuItems m_menuItems;
    SMMenuItem::Pointer m_expandedMenuItem;
    SMMenuButton::Pointer m_scrollUpMenuButton;
    SMMenuButton::Pointer m_scrollDownMenuButton;
    SMMenuButton::Pointer m_topSeparatorButton;
    std::vector<SMMenuButton::Pointer> m_menuButtons;
    bool m_needsButtons = true;
    bool m_needsLayout = false;
    std::shared_ptr<const SMMenuButton::Action> m_action;
    std::int32_t m_style = SMMenuButtonStyleLeftPane;
    std::size_t m_scrollIndex = 0;
    std::unique_ptr<ScrollTimer> m_scrollTimer;
    bool m_disallowScrolling = false;
    bool m_showTopSeparator = false;
    std::optional<platform::Clock::Instant> m_delayedFireDate;
    std::size_t m_firstVisible = 0;
    std::size_t m_endVisible = 0;
};
