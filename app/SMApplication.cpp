#include "app/SMApplication.h"

#include "lib/base/ExceptionLogging.h"
#include "lib/base/Log.h"

#include <exception>

bool SMApplication::notify(QObject* receiver, QEvent* event) {
    try {
        return QApplication::notify(receiver, event);
    } catch (...) {
        KXExceptionHandler::defaultExceptionHandler().handleTopLevelException(std::current_exception());
        return false;
    }
}

void LogToolkitMessages() {
    qInstallMessageHandler([](QtMsgType, const QMessageLogContext& context, const QString& message) {
        Log("%s: %s\n", context.category, message.toUtf8().constData());
    });
}
