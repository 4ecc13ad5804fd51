#pragma once

#include <QApplication>

/// The application object. An exception that reaches the event loop is logged and ends there: the loop goes
/// on.
class SMApplication final : public QApplication {
public:
    using QApplication::QApplication;
    bool notify(QObject* receiver, QEvent* event) override;
};

/// Sends the toolkit's own messages to the log: nothing is written to standard output or standard error.
void LogToolkitMessages();
