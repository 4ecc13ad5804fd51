#include "platform/linux/QtModifierKeys.h"

#include <QGuiApplication>

namespace platform {

bool QtModifierKeys::isOptionDown() const {
    return QGuiApplication::queryKeyboardModifiers().testFlag(Qt::AltModifier);
}

} // namespace platform
