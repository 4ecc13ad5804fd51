#include "server/Texts.h"

#include <QCoreApplication>
#include <string>

namespace tessel {

std::string Localized(const char* text) {
    return QCoreApplication::translate("tesselDaemon", text).toStdString();
}

} // namespace tessel
