#include "app/menuAccessibility.h"

#include "app/SMMenuButtonWidget.h"
#include "app/SMMenuCollectionView.h"
#include "app/SMMenuItem.h"
#include "app/SMMenuListWidget.h"
#include "app/SMThemeView.h"
#include "app/menuRow.h"

#include <QAccessible>
#include <QAccessibleWidget>
#include <algorithm>
#include <cstddef>
#include <memory>
#include <vector>

namespace {

/// After the call: what an action leads to may take the asked object away.
void pressLater(QWidget& host, const SMMenuButton& button, SMMenuCollectionView* list) {
    const auto press =
        [list, weak = std::weak_ptr(std::const_pointer_cast<SMMenuButton>(button.shared_from_this()))] {
            const auto pressed = weak.lock();
            if (!pressed || !pressed->superview() || !pressed->isEnabled()) return;
            if (!pressed->isScrollButton()) {
                pressed->sendAction();
                return;
            }
            // Its own action scrolls for as long as the mouse is over it.
            if (pressed->style() == SMMenuButtonStyleScrollUp)
                list->scrollUp();
            else
                list->scrollDown();
        };
    QMetaObject::invokeMethod(&host, press, Qt::QueuedConnection);
}

bool isShownExpanded(const SMMenuButton& button, const SMMenuCollectionView& list) {
    // In the left pane the folder that the other pane shows is the highlighted one.
    const auto& expanded = list.expandedMenuItem();
    return button.highlighted() || (expanded && button.menuItem()->hasChildItem(expanded.get()));
}

void describeItem(QAccessible::State& state, const SMMenuButton& button, const SMMenuCollectionView& list) {
    const auto& item = button.curMenuItem();
    if (!item) return;
    state.checkable = item->itemState() != 0;
    state.checked = item->itemState() == 1;
    state.checkStateMixed = item->itemState() != 0 && item->itemState() != 1;
    if (!item->submenu()) return;
    state.expandable = true;
    state.expanded = isShownExpanded(button, list);
    state.collapsed = !state.expanded;
}

QAccessible::State stateOf(const SMMenuButton& button) {
    QAccessible::State state;
    state.disabled = !button.isEnabled();
    state.focusable = state.selectable = button.isEnabled();
    state.focused = button.isEnabled() && button.hasMouseOver();
    state.selected = button.isEnabled() && (button.hasMouseOver() || button.highlighted());
    state.invisible = state.offscreen = button.isHidden();
    return state;
}

/// A position in a list. Lives as long as the list's widget, so that nobody holds one that is gone; past the
/// end of a list that has become shorter it is not valid.
class PositionAccessible final : public QAccessibleInterface, public QAccessibleActionInterface {
public:
    PositionAccessible(SMMenuListWidget& host, std::size_t index)
        : m_host(host)
        , m_index(index) {}

    const SMMenuListWidget& host() const { return m_host; }
    int index() const { return static_cast<int>(m_index); }

    bool isValid() const override { return button() != nullptr; }
    QObject* object() const override { return nullptr; }
    QWindow* window() const override { return m_host.window()->windowHandle(); }
    QAccessibleInterface* parent() const override { return QAccessible::queryAccessibleInterface(&m_host); }
    QAccessibleInterface* child(int) const override { return nullptr; }
    QAccessibleInterface* childAt(int, int) const override { return nullptr; }
    int childCount() const override { return 0; }
    int indexOfChild(const QAccessibleInterface*) const override { return -1; }

    QString text(QAccessible::Text kind) const override {
        const SMMenuButton* row = button();
        return row && kind == QAccessible::Name ? QString::fromStdString(row->title()) : QString();
    }
    void setText(QAccessible::Text, const QString&) override {}

    QRect rect() const override {
        const SMMenuButton* row = button();
        if (!row || row->isHidden()) return {};
        const QRect place = m_host.placeOf(*row).toAlignedRect();
        return {m_host.mapToGlobal(place.topLeft()), place.size()};
    }

    QAccessible::Role role() const override {
        const SMMenuButton* row = button();
        const SMMenuItem* item = row ? row->curMenuItem().get() : nullptr;
        if (row && row->isScrollButton()) return QAccessible::Button;
        if (item && item->isSeparator()) return QAccessible::Separator;
        return item && item->isFlexibleSpace() ? QAccessible::Whitespace : QAccessible::ListItem;
    }

    QAccessible::State state() const override {
        const SMMenuButton* row = button();
        QAccessible::State state;
        state.invalid = !row;
        if (!row) return state;
        state = stateOf(*row);
        describeItem(state, *row, *m_host.list());
        if (!m_host.isVisible()) state.invisible = true;
        return state;
    }

    void* interface_cast(QAccessible::InterfaceType type) override {
        return type == QAccessible::ActionInterface ? static_cast<QAccessibleActionInterface*>(this)
                                                    : nullptr;
    }
    QStringList actionNames() const override {
        const SMMenuButton* row = button();
        return row && row->isEnabled() ? QStringList{pressAction()} : QStringList();
    }
    void doAction(const QString& name) override {
        if (const SMMenuButton* row = button(); row && name == pressAction())
            pressLater(m_host, *row, m_host.list());
    }
    QStringList keyBindingsForAction(const QString&) const override { return {}; }

private:
    const SMMenuButton* button() const {
        const SMMenuCollectionView* list = m_host.list();
        return list && m_index < list->menuButtons().size() ? list->menuButtons()[m_index].get() : nullptr;
    }

    SMMenuListWidget& m_host;
    std::size_t m_index;
};

class ListAccessible final : public QAccessibleWidget {
public:
    explicit ListAccessible(SMMenuListWidget& host)
        : QAccessibleWidget(&host, QAccessible::List)
        , m_host(host) {}
    ~ListAccessible() override {
        for (const QAccessible::Id id : m_positions)
            if (id) QAccessible::deleteAccessibleInterface(id);
    }
    ListAccessible(const ListAccessible&) = delete;
    ListAccessible& operator=(const ListAccessible&) = delete;

    int childCount() const override {
        return m_host.list() ? static_cast<int>(m_host.list()->menuButtons().size()) : 0;
    }

    QAccessibleInterface* child(int index) const override {
        if (index < 0 || index >= childCount()) return nullptr;
        const auto at = static_cast<std::size_t>(index);
        if (m_positions.size() <= at) m_positions.resize(at + 1);
        if (!m_positions[at])
            m_positions[at] = QAccessible::registerAccessibleInterface(new PositionAccessible(m_host, at));
        return QAccessible::accessibleInterface(m_positions[at]);
    }

    int indexOfChild(const QAccessibleInterface* child) const override {
        const auto* position = dynamic_cast<const PositionAccessible*>(child);
        return position && &position->host() == &m_host ? position->index() : -1;
    }

    QAccessibleInterface* childAt(int x, int y) const override {
        const QPoint point = m_host.mapFromGlobal(QPoint(x, y));
        if (!m_host.list() || !m_host.rect().contains(point)) return nullptr;
        const auto row = m_host.list()->buttonAt(
            {static_cast<float>(point.x()), static_cast<float>(m_host.height() - point.y()) - 0.5F});
        return row ? childFor(*row) : nullptr;
    }

    QAccessibleInterface* childFor(const SMMenuButton& row) const {
        const auto& rows = m_host.list()->menuButtons();
        const auto found = std::ranges::find(rows, &row, &SMMenuButton::Pointer::get);
        return child(static_cast<int>(found - rows.begin()));
    }

private:
    SMMenuListWidget& m_host;
    mutable std::vector<QAccessible::Id> m_positions; ///< 0 where nobody has asked yet
};

class ButtonAccessible final : public QAccessibleWidget {
public:
    explicit ButtonAccessible(SMMenuButtonWidget& host)
        : QAccessibleWidget(&host, QAccessible::Button)
        , m_host(host) {}

    QString text(QAccessible::Text kind) const override {
        const SMMenuButton* button = m_host.button();
        return button && kind == QAccessible::Name ? QString::fromStdString(button->title()) : QString();
    }
    QAccessible::State state() const override {
        QAccessible::State state = m_host.button() ? stateOf(*m_host.button()) : QAccessible::State();
        if (!m_host.isVisible()) state.invisible = true;
        return state;
    }
    QStringList actionNames() const override { return {pressAction()}; }
    void doAction(const QString& name) override {
        if (m_host.button() && name == pressAction()) pressLater(m_host, *m_host.button(), nullptr);
    }

private:
    SMMenuButtonWidget& m_host;
};

QAccessibleInterface* accessibleFor(const QString&, QObject* object) {
    if (auto* list = dynamic_cast<SMMenuListWidget*>(object)) return new ListAccessible(*list);
    if (auto* button = dynamic_cast<SMMenuButtonWidget*>(object)) return new ButtonAccessible(*button);
    if (auto* view = dynamic_cast<SMThemeView*>(object))
        return new QAccessibleWidget(view, QAccessible::Window);
    return nullptr;
}

} // namespace

void InstallMenuAccessibility() {
    QAccessible::installFactory(accessibleFor); // keeps one of each
}

void ReportMenuFocus(QWidget& host, const SMMenuButton& button) {
    if (!QAccessible::isActive()) return;
    QAccessibleInterface* focused = QAccessible::queryAccessibleInterface(&host);
    if (const auto* list = dynamic_cast<const ListAccessible*>(focused)) focused = list->childFor(button);
    if (!focused) return;
    QAccessibleEvent event(focused, QAccessible::Focus);
    QAccessible::updateAccessibility(&event);
}
