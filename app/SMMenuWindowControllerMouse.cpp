// The one highlighted row, as the mouse and the wheel move it.

#include "app/SMMenuButton.h"
#include "app/SMMenuItem.h"
#include "app/SMMenuModel.h"
#include "app/SMMenuWindowController.h"
#include "app/SMMenuWindowOutlets.h"
#include "lib/base/Geometry.h"
#include "lib/base/IsEqual.h"

#include <chrono>
#include <cmath>
#include <utility>

namespace {

constexpr std::chrono::seconds wheelHoldsHoverScrollingBack{1};

} // namespace

KXRect SMMenuWindowController::frameInWindow(const SMMenuButton& button) const {
    if (&button == m_settingsButton.get()) return m_outlets->areaFrame(SMMenuArea::settingsButton);
    if (&button == m_actionButton.get()) return m_outlets->areaFrame(SMMenuArea::actionButton);
    const bool left = m_leftMenuCollectionView.isSuperviewOf(button);
    const KXRect list = m_outlets->areaFrame(left ? SMMenuArea::leftMenu : SMMenuArea::rightMenuBox);
    const KXRect& frame = button.frame();
    return {list.x + frame.x, list.y + frame.y, frame.width, frame.height};
}

SMMenuButton::Pointer SMMenuWindowController::buttonAt(KXPoint point) const {
    for (const auto& button : {m_settingsButton, m_actionButton})
        if (frameInWindow(*button).contains(point)) return button;
    const std::pair<SMMenuArea, const SMMenuCollectionView*> lists[] = {
        {SMMenuArea::leftMenu, &m_leftMenuCollectionView},
        {SMMenuArea::rightMenuBox, m_rightMenuCollectionView.get()},
    };
    for (const auto& [area, list] : lists) {
        const KXRect frame = m_outlets->areaFrame(area);
        if (frame.contains(point)) return list->buttonAt({point.x - frame.x, point.y - frame.y});
    }
    return nullptr;
}

void SMMenuWindowController::updateMouseOverState(KXPoint point) {
    changeMouseOverButtonTo(buttonAt(point));
}

void SMMenuWindowController::changeMouseOverButtonTo(const SMMenuButton::Pointer& button) {
    if (KXIsEqual(button, m_currentMouseOverMenuButton)) return;
    const auto old = std::exchange(m_currentMouseOverMenuButton, nullptr);
    if (old) old->setHasMouseOver(false);
    m_currentMouseOverMenuButton = button;
    if (button) button->setHasMouseOver(true);
}

void SMMenuWindowController::onMenuCollectionViewDidUpdate(const void* list) {
    const auto current = m_currentMouseOverMenuButton;
    if (KXIsEqual(current, m_actionButton)) return;
    if (current && current->menuItem()) {
        const SMMenuItem* item = current->menuItem().get();
        auto button = m_leftMenuCollectionView.findButtonForMenuItem(item);
        if (!button) button = m_rightMenuCollectionView->findButtonForMenuItem(item);
        if (button) {
            changeMouseOverButtonTo(button);
            return;
        }
    } else if (current && current->superview() && listOf(*current) == list) {
        return;
    }
    const SMMenuItems& results = m_rightMenuCollectionView->menuItems();
    const bool preselects = m_searchState == SMMenuStateSearch && !results.empty();
    changeMouseOverButtonTo(
        preselects ? m_rightMenuCollectionView->findButtonForMenuItem(results.front().get()) : nullptr);
}

void SMMenuWindowController::mouseMoved(KXPoint point) {
    viewWillDraw();
    updateMouseOverState(point);
}

void SMMenuWindowController::mouseDown(KXPoint point) {
    viewWillDraw();
    updateMouseOverState(point);
    m_pressedButton = buttonAt(point);
}

void SMMenuWindowController::mouseUp(KXPoint point) {
    viewWillDraw();
    const auto pressed = std::exchange(m_pressedButton, nullptr);
    const bool released = pressed && pressed->isEnabled() && buttonAt(point) == pressed;
    if (released) pressed->sendAction();
}

void SMMenuWindowController::scrollWheel(double deltaY, KXPoint point) {
    const double distance = std::abs(deltaY);
    if (distance < 0.01) return;
    viewWillDraw();
    const int steps = static_cast<int>(std::round(std::log(distance + 1)) + 1);
    SMMenuCollectionView& list = *m_rightMenuCollectionView;
    for (int i = 0; i < steps; ++i)
        if (!(deltaY > 0 ? list.scrollUp() : list.scrollDown())) break;
    list.setDelayedScrollTimerFireDate(m_services.clock.now() + wheelHoldsHoverScrollingBack);
    updateMouseOverState(point);
}
