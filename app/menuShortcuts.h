#pragma once

#include <functional>

class QWidget;
namespace Ui {
class menuWindow; // NOLINT(*-identifier-naming): the form's name
}

struct MenuShortcutActions {
    std::function<void()> close;
    std::function<void()> settings;
};

/// Brings the keyboard-shortcut menu of the interface file to life: its keys work while the window has the
/// keyboard, and it is the search field's context menu.
void ConnectKeyboardShortcutMenu(const Ui::menuWindow& form, QWidget& window, MenuShortcutActions actions);
