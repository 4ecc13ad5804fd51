#pragma once

#include <QApplication>

/// The application object that painting and windows need; made at the first call, for the rest of the
/// process.
inline QApplication& ensureGuiApplication() {
    static int count = 1;
    static char name[] = "test";
    static char* arguments[] = {name, nullptr};
    static auto* application = new QApplication(count, arguments);
    return *application;
}
