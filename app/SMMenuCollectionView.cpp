#include "app/SMMenuCollectionView.h"

#include "app/SMMenuButton.h"
#include "app/SMMenuItem.h"
#include "app/SMMenuModel.h"
#include "app/menuListLayout.h"
#include "app/menuRow.h"
#include "lib/base/Geometry.h"
#include "lib/base/KXNotificationCenter.h"
#include "platform/MainLoop.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <utility>
#include <vector>

namespace {

constexpr platform::MainLoop::Milliseconds scrollInterval{50};

} // namespace

SMMenuCollectionView::SMMenuCollectionView(Services services)
    : m_services(services) {}

SMMenuCollectionView::~SMMenuCollectionView() {
    // Rows may outlive the list, as the one under the mouse.
    for (const auto& button : m_menuButtons)
        button->setSuperview(nullptr);
    for (const auto& button : {m_scrollUpMenuButton, m_scrollDownMenuButton})
        if (button) button->setAction(nullptr);
}

void SMMenuCollectionView::setSize(KXSize size) {
    m_size = size;
    setNeedsLayout(true);
}

void SMMenuCollectionView::setMenuItems(SMMenuItems items) {
    m_menuItems = std::move(items);
    resetAll();
}

void SMMenuCollectionView::setExpandedMenuItem(SMMenuItem::Pointer item) {
    m_expandedMenuItem = std::move(item);
    resetAll();
}

void SMMenuCollectionView::setAction(SMMenuButton::Action action) {
    m_action = std::make_shared<const SMMenuButton::Action>(std::move(action));
}

void SMMenuCollectionView::resetAll() {
    for (const auto& button : m_menuButtons)
        button->setSuperview(nullptr);
    m_menuButtons.clear();
    m_firstVisible = m_endVisible = 0;
    m_needsButtons = true;
    setNeedsLayout(true);
}

void SMMenuCollectionView::setNeedsLayout(bool needsLayout) {
    m_needsLayout = needsLayout;
    if (needsLayout && m_host) m_host->setNeedsDisplay({0, 0, m_size.width, m_size.height});
}

void SMMenuCollectionView::setNeedsDisplay(const SMMenuButton& button) {
    if (m_host && !button.isHidden()) m_host->setNeedsDisplay(button.frame());
}

void SMMenuCollectionView::viewWillDraw() {
    if (m_needsLayout) performLayout();
}

SMMenuButton::Pointer SMMenuCollectionView::makeButton(std::int32_t style) {
    auto button = std::make_shared<SMMenuButton>(m_services.modifierKeys);
    button->setStyle(style);
    return button;
}

void SMMenuCollectionView::addMenuButtons(const SMMenuItems& items, std::int32_t indentation) {
    for (const auto& item : items) {
        auto button = makeButton(m_style);
        button->setMenuItem(item);
        button->setAction(m_action);
        button->setIndentation(indentation);
        button->setSuperview(this);
        m_menuButtons.push_back(std::move(button));
        if (m_expandedMenuItem && item->submenu() && item->hasChildItem(m_expandedMenuItem.get()))
            addMenuButtons(*item->submenu(), indentation + 1);
    }
}

void SMMenuCollectionView::takeOutExtraButtons() {
    if (!m_topSeparatorButton) {
        const SMMenuButton::Action scroll = [this](SMMenuButton& sender) { onScrollButton(sender); };
        const auto action = std::make_shared<const SMMenuButton::Action>(scroll);
        m_topSeparatorButton = makeButton(m_style);
        m_topSeparatorButton->setMenuItem(SMMenuItem::separatorItem());
        m_scrollUpMenuButton = makeButton(SMMenuButtonStyleScrollUp);
        m_scrollUpMenuButton->setAction(action);
        m_scrollDownMenuButton = makeButton(SMMenuButtonStyleScrollDown);
        m_scrollDownMenuButton->setAction(action);
        return;
    }
    for (const auto& extra : {m_topSeparatorButton, m_scrollUpMenuButton, m_scrollDownMenuButton}) {
        if (!extra->superview()) continue;
        std::erase(m_menuButtons, extra);
        extra->setSuperview(nullptr);
    }
}

void SMMenuCollectionView::insertExtraButton(const SMMenuButton::Pointer& button,
                                             std::optional<std::size_t> index) {
    if (!index) return;
    m_menuButtons.insert(m_menuButtons.begin() + static_cast<std::ptrdiff_t>(*index), button);
    button->setSuperview(this);
}

std::vector<MenuListRow> SMMenuCollectionView::rows() const {
    std::vector<MenuListRow> rows;
    rows.reserve(m_menuButtons.size());
    for (const auto& button : m_menuButtons) {
        const auto& item = button->menuItem();
        rows.push_back({button->preferredHeight(), item && item->isFlexibleSpace()});
    }
    return rows;
}

MenuListState SMMenuCollectionView::layoutState() const {
    MenuListState state;
    state.height = m_size.height;
    state.scrollIndex = m_scrollIndex;
    state.disallowScrolling = m_disallowScrolling;
    if (m_showTopSeparator) state.topSeparatorHeight = m_topSeparatorButton->preferredHeight();
    state.scrollArrowHeight = m_scrollDownMenuButton->preferredHeight();
    return state;
}

void SMMenuCollectionView::makeButtons() {
    if (m_needsButtons) {
        m_needsButtons = false;
        m_menuButtons.reserve(m_menuItems.size() + 3);
        addMenuButtons(m_menuItems, 0);
        const std::size_t count = m_menuButtons.size();
        if (count == 0 || m_disallowScrolling) m_scrollIndex = 0;
        if (count > 0 && m_scrollIndex >= count) m_scrollIndex = count - 1;
    }
    takeOutExtraButtons();
}

void SMMenuCollectionView::performLayout() {
    m_needsLayout = false;
    makeButtons();
    m_scrollIndex = std::min(m_scrollIndex, m_menuButtons.size());
    const MenuListLayout layout = layoutMenuList(rows(), layoutState());
    insertExtraButton(m_topSeparatorButton, layout.topSeparator);
    insertExtraButton(m_scrollUpMenuButton, layout.scrollUp);
    insertExtraButton(m_scrollDownMenuButton, layout.scrollDown);
    placeButtons(layout.places);
    if (m_host) m_host->setNeedsDisplay({0, 0, m_size.width, m_size.height});
    KXNotificationCenter::defaultCenter().postNotification(SMMenuCollectionViewDidUpdateNotification, this);
}

void SMMenuCollectionView::placeButtons(const std::vector<MenuRowPlace>& places) {
    m_firstVisible = places.size();
    m_endVisible = 0;
    for (std::size_t i = 0; i < places.size(); ++i) {
        m_menuButtons[i]->setFrame({0, places[i].y, m_size.width, places[i].height});
        m_menuButtons[i]->setHidden(places[i].hidden);
        if (places[i].hidden) continue;
        m_firstVisible = std::min(m_firstVisible, i);
        m_endVisible = i + 1;
    }
}

std::vector<SMMenuButton::Pointer>::const_iterator
SMMenuCollectionView::findRow(const SMMenuItem* item) const {
    if (!item) return m_menuButtons.end();
    return std::ranges::find_if(m_menuButtons, [item](const auto& b) { return b->menuItem().get() == item; });
}

SMMenuButton::Pointer SMMenuCollectionView::findButtonForMenuItem(const SMMenuItem* item) const {
    const auto found = findRow(item);
    return found == m_menuButtons.end() ? nullptr : *found;
}

SMMenuButton::Pointer SMMenuCollectionView::buttonAt(KXPoint point) const {
    SMMenuButton::Pointer hit;
    forEachVisibleButton([&](SMMenuButton& button) {
        if (button.frame().contains(point)) hit = button.shared_from_this();
    });
    return hit;
}

bool SMMenuCollectionView::scrollUp() {
    if (m_disallowScrolling || !m_scrollUpMenuButton || !m_scrollUpMenuButton->superview()) return false;
    m_scrollIndex = scrollIndexUp(layoutState()).value_or(0);
    performLayout();
    return true;
}

bool SMMenuCollectionView::scrollDown() {
    if (m_disallowScrolling || !m_scrollDownMenuButton || !m_scrollDownMenuButton->superview()) return false;
    const std::size_t before = m_scrollIndex;
    m_scrollIndex += m_scrollUpMenuButton->superview() ? 1 : 2;
    performLayout();
    return m_scrollIndex > before; // a list too low even for its arrows shows one at the end, too
}

SMMenuButton::Pointer SMMenuCollectionView::scrollItemToVisible(const SMMenuItem* item) {
    makeButtons();
    const auto found = findRow(item);
    // Where the steps would lead, laid out once: a layout for every step would be quadratic.
    if (found != m_menuButtons.end())
        m_scrollIndex = scrollIndexShowing(rows(), layoutState(),
                                           static_cast<std::size_t>(found - m_menuButtons.begin()));
    const auto button = found == m_menuButtons.end() ? nullptr : *found;
    performLayout();
    return button && !button->isHidden() ? button : nullptr;
}

void SMMenuCollectionView::onScrollButton(SMMenuButton& sender) {
    if (!sender.hasMouseOver()) {
        setDelayedScrollTimerFireDate({});
        m_scrollTimer.reset();
        return;
    }
    const bool up = &sender == m_scrollUpMenuButton.get();
    if (m_scrollTimer && m_scrollTimer->up != up) m_scrollTimer.reset();
    if (m_scrollTimer) return;
    const auto soon = m_services.clock.now() + scrollInterval;
    startScrollTimer(up, std::max(soon, m_delayedFireDate.value_or(soon)));
}

void SMMenuCollectionView::startScrollTimer(bool up, platform::Clock::Instant fireDate) {
    const auto delay = std::chrono::ceil<platform::MainLoop::Milliseconds>(fireDate - m_services.clock.now());
    auto handle = m_services.mainLoop.startTimer(std::max(delay, platform::MainLoop::Milliseconds{0}),
                                                 scrollInterval, [this] { onScrollTimer(); });
    m_scrollTimer = std::make_unique<ScrollTimer>(ScrollTimer{up, fireDate, std::move(handle)});
}

void SMMenuCollectionView::onScrollTimer() {
    m_scrollTimer->fireDate = m_services.clock.now() + scrollInterval;
    const bool scrolled = m_scrollTimer->up ? scrollUp() : scrollDown();
    if (!scrolled) m_scrollTimer.reset();
    setDelayedScrollTimerFireDate({});
}

void SMMenuCollectionView::setDelayedScrollTimerFireDate(std::optional<platform::Clock::Instant> date) {
    m_delayedFireDate = date;
    if (date && m_scrollTimer && m_scrollTimer->fireDate < *date) startScrollTimer(m_scrollTimer->up, *date);
}

SMMenuButton::Pointer SMMenuCollectionView::findValidKeyViewNearYPos(float y, const Neighbour& previous,
                                                                     const Neighbour& next) const {
    constexpr float farAway = 2147483648.0F;
    // Signed on purpose: a neighbour that lies on the wrong side of y counts as nearer than any row.
    SMMenuButton::Pointer above = previous.button;
    float distanceAbove = (above ? previous.y : farAway) - y;
    SMMenuButton::Pointer below = next.button;
    float distanceBelow = y - (below ? next.y : -farAway);
    for (const auto& button : m_menuButtons) {
        if (!button->isEnabled() || button->isHidden()) continue;
        const float center = button->frame().y + 0.5F * button->frame().height;
        if (center > y && center - y < distanceAbove) {
            above = button;
            distanceAbove = center - y;
        }
        if (center < y && y - center < distanceBelow) {
            below = button;
            distanceBelow = y - center;
        }
    }
    return distanceBelow <= distanceAbove ? below : above;
}
