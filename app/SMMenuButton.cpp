#include "app/SMMenuButton.h"

#include "app/SMMenuItem.h"
#include "app/menuMirroring.h"
#include "app/menuPainter.h"
#include "app/menuRow.h"
#include "lib/base/Geometry.h"
#include "lib/kxAppKit/KXGeometry.h"
#include "lib/kxAppKit/KXImage.h" // IWYU pragma: keep
#include "platform/ModifierKeys.h"

#include <QPainter>
#include <cmath>
#include <cstdint>
#include <string>
#include <utility>

namespace {

const char* markOf(const SMMenuItem* item) {
    if (!item || item->itemState() == 0) return nullptr;
    return item->itemState() == 1 ? "\u2713" : "-";
}

bool isSeparator(const SMMenuItem* item) {
    return item && item->isSeparator();
}

} // namespace

void SMMenuButton::setMenuItem(SMMenuItem::Pointer item) {
    if (!item) m_title = title(); // it keeps the title it showed last
    m_menuItem = std::move(item);
    // Never enabled again here, even by an item that can be chosen.
    if (m_menuItem && (!m_menuItem->enabled() || m_menuItem->isSeparator() || m_menuItem->isFlexibleSpace()))
        m_enabled = false;
    setNeedsDisplay();
}

const SMMenuItem::Pointer& SMMenuButton::curMenuItem() const {
    if (m_menuItem && m_menuItem->altMenuItem() && m_keys->isOptionDown()) return m_menuItem->altMenuItem();
    return m_menuItem;
}

const std::string& SMMenuButton::title() const {
    const auto& item = curMenuItem();
    return item ? item->title() : m_title;
}

void SMMenuButton::setTitle(std::string title) {
    m_title = std::move(title);
    setNeedsDisplay();
}

void SMMenuButton::setHighlighted(bool highlighted) {
    m_highlighted = highlighted;
    setNeedsDisplay();
}

void SMMenuButton::setHasMouseOver(bool hasMouseOver) {
    m_hasMouseOver = hasMouseOver;
    setNeedsDisplay();
    if (isScrollButton()) sendAction();
}

void SMMenuButton::setIndentation(std::int32_t indentation) {
    m_indentation = indentation;
    setNeedsDisplay();
}

bool SMMenuButton::isScrollButton() const {
    return m_style == SMMenuButtonStyleScrollUp || m_style == SMMenuButtonStyleScrollDown;
}

void SMMenuButton::sendAction() {
    const auto self = shared_from_this();
    const auto action = m_action;
    if (action && *action) (*action)(*this);
}

float SMMenuButton::preferredHeight() const {
    const MenuRowMetrics& metrics = menuRowMetrics(m_style);
    const SMMenuItem* item = m_menuItem.get();
    // Asking for the keys costs a round trip to the display, and a list of thousands of rows asks for
    // heights.
    const bool alternates = m_style != SMMenuButtonStyleLeftPane && !isScrollButton() && item &&
                            item->altMenuItem() && item->altMenuItem()->isSeparator() != item->isSeparator();
    if (alternates) item = curMenuItem().get();
    return isSeparator(item) ? metrics.separatorHeight : metrics.height;
}

void SMMenuButton::setNeedsDisplay() {
    if (m_superview) m_superview->setNeedsDisplay(*this);
}

MenuRowContent SMMenuButton::content(const SMMenuItem* item, KXSize size) const {
    const bool alwaysArrow = m_style == SMMenuButtonStyleBack || m_style == SMMenuButtonStyleAllPrograms;
    const auto parent = item ? item->parent() : nullptr;
    MenuRowContent content;
    content.style = m_style;
    content.indentation = m_indentation;
    content.size = size;
    content.isMirrored = menuIsMirrored();
    content.hasArrow = alwaysArrow || (item && item->submenu() && !item->hideTriangle());
    content.parentHasCheckmark =
        m_style != SMMenuButtonStyleLeftPane && parent && parent->submenuHasCheckmark();
    return content;
}

void SMMenuButton::draw(QPainter& painter, KXSize size, MenuPainter& tools) const {
    const auto item = curMenuItem();
    if (isSeparator(item.get())) {
        if (m_style != SMMenuButtonStyleList && m_style != SMMenuButtonStyleHome) return;
        const float y = std::round(size.height * 0.5F) - 1;
        tools.fillWhite(painter, {0, y, size.width, 1}, 0.7F, 0.5F);
        tools.fillWhite(painter, {0, y + 1, size.width, 1}, 1, 0.4F);
        return;
    }
    if (item && item->isFlexibleSpace()) return;

    const bool highlighted = isDrawnHighlighted();
    if (highlighted) {
        tools.fillGradient(painter, {0, 0, size.width, size.height}, MenuGradientUse::rowHighlight);
        tools.fillWhite(painter, {0, 0, size.width, 1}, 0, 0.1F);
        tools.fillWhite(painter, {0, size.height - 1, size.width, 1}, 0, 0.15F);
    }
    if (isScrollButton()) {
        tools.fillArrow(painter, menuScrollArrowRect(size), menuScrollArrowDirection(m_style),
                        menuArrowWhite(m_style, highlighted));
        return;
    }
    drawContent(painter, size, tools, item.get());
}

void SMMenuButton::drawContent(QPainter& painter, KXSize size, MenuPainter& tools, SMMenuItem* item) const {
    const bool highlighted = isDrawnHighlighted();
    const std::string& title = item ? item->title() : m_title;
    const float white = menuTitleWhite(m_style, m_enabled, highlighted);
    const char* mark = markOf(item);
    const auto icon = item && m_style != SMMenuButtonStyleLeftPane ? item->icon() : nullptr;

    MenuRowContent parts = content(item, size);
    parts.titleSize = tools.textSize(title);
    if (mark) parts.markSize = tools.textSize(mark);
    if (icon) parts.iconAspect = KXSizeAspectRatio(icon->size());
    const MenuRowGeometry geometry = menuRowGeometry(parts);

    if (geometry.mark) tools.drawText(painter, mark, *geometry.mark, white);
    if (geometry.icon) tools.drawIcon(painter, *icon, *geometry.icon);
    tools.drawText(painter, title, geometry.title, white);
    if (geometry.arrow)
        tools.fillArrow(painter, *geometry.arrow, geometry.arrowDirection,
                        menuArrowWhite(m_style, highlighted));
}
