// Search, and the walk that moves the highlighted row by the keyboard.

#include "app/SMEditingCommand.h"
#include "app/SMMenuButton.h"
#include "app/SMMenuModel.h"
#include "app/SMMenuWindowController.h"
#include "app/SMMenuWindowOutlets.h"
#include "app/menuRow.h"
#include "app/menuSearchIndex.h"
#include "lib/base/Geometry.h"

#include <QString>
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

/// The buttons in the order in which the keyboard visits them, from the search field round to it again.
struct SMMenuWindowController::KeyViewRing {
    std::vector<SMMenuButton::Pointer> buttons;
    std::size_t leftEnd = 0;
    std::size_t rightBegin = 0;

    /// The first valid one at or after a place; null where the search field comes first.
    SMMenuButton::Pointer validFrom(std::size_t begin) const {
        for (std::size_t i = begin; i < buttons.size(); ++i)
            if (buttons[i]->canBecomeKeyView()) return buttons[i];
        return nullptr;
    }
    /// The last valid one before a place.
    SMMenuButton::Pointer validBefore(std::size_t end) const {
        for (std::size_t i = end; i > 0; --i)
            if (buttons[i - 1]->canBecomeKeyView()) return buttons[i - 1];
        return nullptr;
    }
    SMMenuButton::Pointer next(const SMMenuButton::Pointer& button) const {
        const auto found = std::ranges::find(buttons, button);
        if (found == buttons.end()) return nullptr;
        return validFrom(static_cast<std::size_t>(found - buttons.begin()) + 1);
    }
    SMMenuButton::Pointer previous(const SMMenuButton::Pointer& button) const {
        const auto found = std::ranges::find(buttons, button);
        if (found == buttons.end()) return nullptr;
        return validBefore(static_cast<std::size_t>(found - buttons.begin()));
    }
};

SMMenuWindowController::KeyViewRing SMMenuWindowController::keyViewRing() const {
    const auto& left = m_leftMenuCollectionView.menuButtons();
    const auto& right = m_rightMenuCollectionView->menuButtons();
    KeyViewRing ring;
    ring.buttons.reserve(left.size() + right.size() + 2);
    ring.buttons = left;
    ring.leftEnd = ring.buttons.size();
    ring.buttons.push_back(m_settingsButton);
    ring.buttons.push_back(m_actionButton);
    ring.rightBegin = ring.buttons.size();
    ring.buttons.insert(ring.buttons.end(), right.begin(), right.end());
    return ring;
}

std::string SMMenuWindowController::searchText() const {
    return QString::fromStdString(m_outlets->searchString()).trimmed().toStdString();
}

const MenuSearchIndex& SMMenuWindowController::searchIndex() {
    m_indexing.reset();
    const auto& apps = m_owner.model().searchableApps;
    if (m_searchIndex.items() != apps) m_searchIndex = MenuSearchIndex(apps);
    return m_searchIndex;
}

SMMenuItems SMMenuWindowController::filterAppListWithSearchText(const std::string& text) {
    return searchIndex().itemsContaining(text);
}

void SMMenuWindowController::controlTextDidChange() {
    const std::string text = searchText();
    if (text.empty()) {
        if (m_searchState != SMMenuStateHome) changeStateTo(SMMenuStateHome, SMMenuAnimationNone);
        return;
    }
    if (m_searchState == SMMenuStateSearch)
        m_rightMenuCollectionView->setMenuItems(filterAppListWithSearchText(text));
    else
        changeStateTo(SMMenuStateSearch, SMMenuAnimationNone);
    changeMouseOverButtonTo(nullptr);
    tellResultCount();
}

void SMMenuWindowController::tellResultCount() {
    std::optional<std::size_t> count;
    if (m_searchState == SMMenuStateSearch) count = m_rightMenuCollectionView->menuItems().size();
    m_outlets->setResultCount(count);
}

bool SMMenuWindowController::doCommandBySelector(SMEditingCommand command) {
    viewWillDraw();
    switch (command) {
    case SMEditingCommand::cancelOperation:
        if (m_searchState == SMMenuStateSearch)
            changeStateTo(SMMenuStateHome, SMMenuAnimationNone);
        else
            m_owner.closeMenuWindow();
        return true;
    case SMEditingCommand::insertNewline: {
        const auto button = m_currentMouseOverMenuButton;
        if (button && button->isEnabled()) button->sendAction();
        return true;
    }
    case SMEditingCommand::insertTab:
        return true;
    case SMEditingCommand::moveLeft:
    case SMEditingCommand::moveRight: {
        const auto& button = m_currentMouseOverMenuButton;
        const bool isLeft = button && m_leftMenuCollectionView.isSuperviewOf(*button);
        const bool leaves = isLeft == (command == SMEditingCommand::moveRight);
        return leaves && searchText().empty() && moveMouseOver(command);
    }
    case SMEditingCommand::moveDown:
    case SMEditingCommand::moveUp:
        moveMouseOver(command);
        return true;
    }
    return false;
}

bool SMMenuWindowController::moveMouseOver(SMEditingCommand command) {
    const bool upward = command == SMEditingCommand::moveUp;
    for (;;) {
        const auto result = walk(startOfWalk(command), upward);
        if (!result) return false;
        SMMenuCollectionView* list = listOf(*result);
        if (result->isScrollButton() && list) {
            // The row that the arrow hid comes into view; then the same key again from the current row.
            if (!(upward ? list->scrollUp() : list->scrollDown())) return false;
            continue;
        }
        if (result->isHidden()) return false;
        changeMouseOverButtonTo(result);
        m_outlets->didHighlightByKeyboard(*result);
        return true;
    }
}

SMMenuButton::Pointer SMMenuWindowController::startOfWalk(SMEditingCommand command) const {
    const auto& current = m_currentMouseOverMenuButton;
    switch (command) {
    case SMEditingCommand::moveLeft:
        return rowBeside(SMMenuArea::leftMenu);
    case SMEditingCommand::moveRight:
        return rowBeside(SMMenuArea::rightMenuBox);
    case SMEditingCommand::moveUp:
        return current ? keyViewRing().previous(current) : nullptr;
    default: {
        const KeyViewRing ring = keyViewRing();
        return current ? ring.next(current) : ring.validFrom(0);
    }
    }
}

SMMenuButton::Pointer SMMenuWindowController::rowBeside(SMMenuArea area) const {
    const bool left = area == SMMenuArea::leftMenu;
    const SMMenuCollectionView& list = left ? m_leftMenuCollectionView : *m_rightMenuCollectionView;
    const KXRect listFrame = m_outlets->areaFrame(area);
    // Rows count y downwards, so the origin of one is its upper edge.
    const auto& current = m_currentMouseOverMenuButton;
    const float y = current ? frameInWindow(*current).maxY() - listFrame.y : 0;

    const auto neighbour = [&](const SMMenuButton::Pointer& button) -> SMMenuCollectionView::Neighbour {
        if (!button) return {};
        const KXRect frame = frameInWindow(*button);
        const bool overlaps = frame.minX() <= listFrame.maxX() && listFrame.minX() <= frame.maxX();
        if (!overlaps) return {};
        return {button, frame.y + 0.5F * frame.height - listFrame.y};
    };
    const KeyViewRing ring = keyViewRing();
    const auto previous = ring.validBefore(left ? 0 : ring.rightBegin);
    const auto next = ring.validFrom(left ? ring.leftEnd : ring.buttons.size());
    return list.findValidKeyViewNearYPos(y, neighbour(previous), neighbour(next));
}

SMMenuButton::Pointer SMMenuWindowController::walk(SMMenuButton::Pointer candidate, bool upward) {
    while (candidate) {
        SMMenuCollectionView* list = listOf(*candidate);
        if (list && candidate->isHidden()) {
            if (auto shown = list->scrollItemToVisible(candidate->menuItem().get())) return shown;
        }
        const std::int32_t passedOver = upward ? SMMenuButtonStyleScrollDown : SMMenuButtonStyleScrollUp;
        if (candidate->style() != passedOver && !candidate->isHidden()) return candidate;
        const KeyViewRing ring = keyViewRing();
        candidate = upward ? ring.previous(candidate) : ring.next(candidate);
    }
    return nullptr;
}

SMMenuCollectionView* SMMenuWindowController::listOf(const SMMenuButton& button) {
    if (m_leftMenuCollectionView.isSuperviewOf(button)) return &m_leftMenuCollectionView;
    return m_rightMenuCollectionView->isSuperviewOf(button) ? m_rightMenuCollectionView.get() : nullptr;
}

void SMMenuWindowController::flagsChanged(bool optionDown) {
    if (optionDown == m_isOptionKeyPressed) return;
    m_isOptionKeyPressed = optionDown;
    m_outlets->setNeedsDisplay();
}
