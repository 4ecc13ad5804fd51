#pragma once

#include "app/SMMenuListWidget.h"
#include "app/SMMenuWindowForm.h"
#include "app/SMSearchField.h"
#include "app/menuPainter.h"
#include "tests/app/MenuFixtures.h"
#include "tests/support/InMemoryDesktop.h"

#include <QApplication>

/// The real window and controller, on a display that shows nothing.
struct PanelWorld {
    /// `widget<QWidget>("menuWindow")` is the panel itself.
    template <typename Widget = QWidget>
    Widget* widget(const char* name) const {
        return view->objectName() == name ? dynamic_cast<Widget*>(view) : view->findChild<Widget*>(name);
    }
    void makeWindow(platform::WindowServer& server) {
        window = nullptr; // so that there is never more than one
        window = SMMenuWindowMaker({server, loop.clock(), loop, keys, defaults}).make(owner);
        owner.window = window.get();
        for (QWidget* panel : QApplication::topLevelWidgets())
            if (panel->objectName() == "menuWindow") view = panel;
        field = widget<SMSearchField>("searchField");
        box = widget<SMMenuListWidget>("rightMenuBox");
    }
    SMMenuWindowController& controller() const { return dynamic_cast<SMMenuWindowController&>(*window); }

    FakeKeys keys;
    InMemoryDesktop::Defaults defaults;
    ManualMainLoop loop;
    FakeOwner owner;
    std::unique_ptr<SMMenuWindow> window;
    QWidget* view = nullptr;
    SMSearchField* field = nullptr;
    SMMenuListWidget* box = nullptr;
};
