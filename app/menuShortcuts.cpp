#include "app/menuShortcuts.h"

#include "app/SMSearchField.h"
#include "ui_menuWindow.h"

#include <QAction>
#include <QClipboard>
#include <QMenu>
#include <QMimeData>
#include <utility>

void ConnectKeyboardShortcutMenu(const Ui::menuWindow& form, QWidget& window, MenuShortcutActions actions) {
    SMSearchField* field = form.searchField;
    QMenu* menu = form.keyboardShortcutMenu;
    const std::pair<QAction*, void (QLineEdit::*)()> editing[] = {
        {form.undoAction, &QLineEdit::undo},
        {form.cutAction, &QLineEdit::cut},
        {form.pasteAction, &QLineEdit::paste},
        {form.selectAllAction, &QLineEdit::selectAll},
    };
    for (const auto& [action, edit] : editing)
        QObject::connect(action, &QAction::triggered, field, edit);
    QObject::connect(form.copyAction, &QAction::triggered, field, &QLineEdit::copy);
    QObject::connect(form.closeAction, &QAction::triggered, &window, std::move(actions.close));
    QObject::connect(form.settingsAction, &QAction::triggered, &window, std::move(actions.settings));

    QObject::connect(menu, &QMenu::aboutToShow, field, [form, field] {
        form.undoAction->setEnabled(field->isUndoAvailable());
        form.cutAction->setEnabled(field->hasSelectedText());
        form.copyAction->setEnabled(field->hasSelectedText());
        form.pasteAction->setEnabled(!QGuiApplication::clipboard()->text().isEmpty());
        form.selectAllAction->setEnabled(!field->text().isEmpty());
    });
    // A disabled entry's key would be dead until the menu is next opened.
    QObject::connect(menu, &QMenu::aboutToHide, menu, [menu] {
        for (QAction* action : menu->actions())
            action->setEnabled(true);
    });
    window.addActions(menu->actions());
    field->setContextMenuPolicy(Qt::CustomContextMenu);
    QObject::connect(field, &QWidget::customContextMenuRequested, menu,
                     [menu, field](QPoint place) { menu->popup(field->mapToGlobal(place)); });
}
