#include "app/SMMenuWindowForm.h"

#include "app/SMBorderlessWindow.h"
#include "app/SMEditingCommand.h"
#include "app/SMMenuButton.h"
#include "app/SMMenuButtonWidget.h"
#include "app/SMMenuCollectionView.h"
#include "app/SMMenuHostWidget.h"
#include "app/SMMenuListWidget.h"
#include "app/SMMenuWindow.h"
#include "app/SMMenuWindowController.h"
#include "app/SMMenuWindowOutlets.h"
#include "app/SMMenuWindowOwner.h"
#include "app/SMSearchField.h"
#include "app/SMThemeView.h"
#include "app/SMTitlePopUpButton.h"
#include "app/menuAccessibility.h"
#include "app/menuMirroring.h"
#include "app/menuPainter.h"
#include "app/menuShortcuts.h"
#include "lib/base/Geometry.h"
#include "platform/Clock.h"
#include "platform/WindowServer.h"
#include "ui_menuWindow.h"

#include <QLayout>
#include <QStringList>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <initializer_list>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace {

constexpr const char* resultCount = QT_TRANSLATE_N_NOOP("menuWindow", "%n result(s)");

/// Lays the widgets out now: the toolkit itself waits until they are shown.
void layOutNow(QWidget& widget) {
    if (QLayout* layout = widget.layout()) layout->setGeometry(widget.rect());
    for (QObject* child : widget.children())
        if (child->isWidgetType()) layOutNow(*static_cast<QWidget*>(child));
}

/// Layouts mirror what they hold, but not their margins.
void mirrorMargins(QObject& object) {
    if (auto* layout = qobject_cast<QLayout*>(&object)) {
        const QMargins margins = layout->contentsMargins();
        layout->setContentsMargins(margins.right(), margins.top(), margins.left(), margins.bottom());
    }
    for (QObject* child : object.children())
        mirrorMargins(*child);
}

class MenuWindowForm final : public SMMenuWindowOutlets {
public:
    MenuWindowForm(const SMMenuWindowServices& services, std::function<KXRect()> statusItemFrame);

    void paintUnseen();

    void setDelegate(SMMenuWindowEvents* delegate) override;

    bool isVisible() const override { return m_window->isVisible(); }
    KXRect frame() const override { return m_window->frame(); }
    void setFrame(const KXRect& frame) override;
    KXRect visibleScreenFrame() const override { return m_windowServer.visibleFrame(m_statusItemFrame()); }
    void makeKeyAndOrderFront() override;
    void orderOut() override { m_window->orderOut(); }
    void setNeedsDisplay() override { m_view.update(); }

    KXRect areaFrame(SMMenuArea area) const override;
    void setButton(SMMenuArea area, SMMenuButton* button) override;
    void setLeftList(SMMenuCollectionView* list) override { m_ui.leftMenuCollectionView->setList(list); }
    void setRightList(SMMenuCollectionView* list, std::int32_t animation) override;

    void setVMList(const std::vector<std::string>& names) override;
    void selectVM(std::int32_t index) override;
    std::int32_t indexOfSelectedVM() const override { return m_ui.vmListPopUpButton->currentIndex(); }

    std::string searchString() const override { return m_ui.searchField->stringValue(); }
    void setSearchString(const std::string& text) override { m_ui.searchField->setStringValue(text); }
    void setResultCount(std::optional<std::size_t> count) override;
    void didHighlightByKeyboard(const SMMenuButton& button) override;

private:
    const QWidget& widgetOf(SMMenuArea area) const;

    platform::WindowServer& m_windowServer;
    const platform::Clock& m_clock;
    std::function<KXRect()> m_statusItemFrame;
    MenuPainter m_painter;
    SMThemeView m_view;
    Ui::menuWindow m_ui;
    std::unique_ptr<SMBorderlessWindow> m_window;
    SMMenuWindowEvents* m_delegate = nullptr;
    QStringList m_names; ///< of the machines
};

MenuWindowForm::MenuWindowForm(const SMMenuWindowServices& services, std::function<KXRect()> statusItemFrame)
    : m_windowServer(services.windowServer)
    , m_clock(services.clock)
    , m_statusItemFrame(std::move(statusItemFrame))
    , m_painter(services.userDefaults) {
    InstallMenuAccessibility();
    m_ui.setupUi(&m_view);
    if (menuIsMirrored()) mirrorMargins(m_view);
    m_window = std::make_unique<SMBorderlessWindow>(services.windowServer, m_view, m_statusItemFrame);
    const std::initializer_list<SMMenuHostWidget*> hosts = {
        &m_view, m_ui.leftMenuCollectionView, m_ui.rightMenuBox, m_ui.settingsButton, m_ui.actionButton};
    for (SMMenuHostWidget* host : hosts)
        host->setPainter(&m_painter);
    m_view.trackMouseOver(*m_ui.searchField);
    m_view.trackMouseOver(*m_ui.vmListPopUpButton);
    m_ui.searchField->setCommandHandler(
        [this](SMEditingCommand command) { return m_delegate && m_delegate->doCommandBySelector(command); });
    m_ui.searchField->setTextHandler([this] {
        if (m_delegate) m_delegate->controlTextDidChange();
    });
    ConnectKeyboardShortcutMenu(m_ui, m_view,
                                {.close =
                                     [this] {
                                         if (m_delegate) m_delegate->onCloseShortcut();
                                     },
                                 .settings =
                                     [this] {
                                         if (m_delegate) m_delegate->onSettingsShortcut();
                                     }});
    QObject::connect(m_ui.vmListPopUpButton, &QComboBox::activated, &m_view, [this] {
        if (m_delegate) m_delegate->onVMListPopUpButton();
    });
    setFrame(frame());
}

void MenuWindowForm::paintUnseen() {
    m_view.winId(); // makes the native window
    m_view.grab();
}

void MenuWindowForm::setDelegate(SMMenuWindowEvents* delegate) {
    m_delegate = delegate;
    m_view.setDelegate(delegate);
    m_window->setDelegate(delegate);
}

void MenuWindowForm::setFrame(const KXRect& frame) {
    m_window->setFrame(frame);
    layOutNow(m_view);
    m_view.setPanes({areaFrame(SMMenuArea::topPane), areaFrame(SMMenuArea::rightPane)});
    m_ui.leftMenuCollectionView->fitList();
    m_ui.rightMenuBox->fitList();
}

void MenuWindowForm::makeKeyAndOrderFront() {
    if (m_delegate) m_delegate->viewWillDraw();
    m_window->makeKeyAndOrderFront();
    m_ui.searchField->setFocus();
}

const QWidget& MenuWindowForm::widgetOf(SMMenuArea area) const {
    switch (area) {
    case SMMenuArea::topPane:
        return *m_ui.topPaneBox;
    case SMMenuArea::leftPane:
        return *m_ui.leftPaneBox;
    case SMMenuArea::rightPane:
        return *m_ui.rightPaneBox;
    case SMMenuArea::leftMenu:
        return *m_ui.leftMenuCollectionView;
    case SMMenuArea::rightMenuBox:
        return *m_ui.rightMenuBox;
    case SMMenuArea::settingsButton:
        return *m_ui.settingsButton;
    case SMMenuArea::actionButton:
        break;
    }
    return *m_ui.actionButton;
}

KXRect MenuWindowForm::areaFrame(SMMenuArea area) const {
    const QWidget& widget = widgetOf(area);
    const QPoint corner = widget.mapTo(&m_view, QPoint(0, widget.height()));
    return {static_cast<float>(corner.x()), static_cast<float>(m_view.height() - corner.y()),
            static_cast<float>(widget.width()), static_cast<float>(widget.height())};
}

void MenuWindowForm::setButton(SMMenuArea area, SMMenuButton* button) {
    (area == SMMenuArea::settingsButton ? m_ui.settingsButton : m_ui.actionButton)->setButton(button);
}

void MenuWindowForm::setRightList(SMMenuCollectionView* list, std::int32_t animation) {
    if (animation == SMMenuAnimationNone || !isVisible() || m_windowServer.reducesMotion()) {
        m_ui.rightMenuBox->setList(list);
        return;
    }
    m_ui.rightMenuBox->slideTo(list, animation == SMMenuAnimationForward, m_clock);
    list->setNeedsLayout(true); // so that its notice comes once more, when it is the current list
}

void MenuWindowForm::setVMList(const std::vector<std::string>& names) {
    QStringList titles;
    for (const std::string& name : names)
        titles.append(QString::fromStdString(name));
    if (titles == m_names) return; // the list may be open just now
    m_names = titles;
    m_ui.vmListPopUpButton->clear();
    m_ui.vmListPopUpButton->addItems(titles);
}

void MenuWindowForm::selectVM(std::int32_t index) {
    if (index >= 0 && index < m_ui.vmListPopUpButton->count()) m_ui.vmListPopUpButton->setCurrentIndex(index);
}

void MenuWindowForm::setResultCount(std::optional<std::size_t> count) {
    const QString results =
        count ? QCoreApplication::translate("menuWindow", resultCount, nullptr, static_cast<int>(*count))
              : QString();
    // Every call is a message to assistive technology, whatever it changes.
    if (results != m_ui.searchField->accessibleDescription())
        m_ui.searchField->setAccessibleDescription(results);
}

void MenuWindowForm::didHighlightByKeyboard(const SMMenuButton& button) {
    for (SMMenuButtonWidget* host : {m_ui.settingsButton, m_ui.actionButton})
        if (host->button() == &button) ReportMenuFocus(*host, button);
    for (SMMenuListWidget* host : {m_ui.leftMenuCollectionView, m_ui.rightMenuBox})
        if (host->list() && host->list()->isSuperviewOf(button)) ReportMenuFocus(*host, button);
}

std::unique_ptr<MenuWindowForm> loadForm(const SMMenuWindowServices& services, SMMenuWindowOwner& owner) {
    return std::make_unique<MenuWindowForm>(services, [&owner] { return owner.statusItemFrame(); });
}

} // namespace

void SMMenuWindowMaker::prepare(SMMenuWindowOwner& owner) {
    auto form = loadForm(m_services, owner);
    form->paintUnseen();
    m_prepared = std::move(form);
}

std::unique_ptr<SMMenuWindow> SMMenuWindowMaker::make(SMMenuWindowOwner& owner) {
    if (!m_prepared) m_prepared = loadForm(m_services, owner);
    return std::make_unique<SMMenuWindowController>(
        owner, SMMenuCollectionView::Services{m_services.clock, m_services.mainLoop, m_services.modifierKeys},
        std::move(m_prepared));
}
