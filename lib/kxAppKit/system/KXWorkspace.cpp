#include "lib/kxAppKit/system/KXWorkspace.h"

#include "lib/kxAppKit/system/KXProcess.h"
#include <string>

bool KXWorkspace::isAppWithBundleIdentifierRunning(const std::string& bundleID) const {
    return KXProcess::processWithBundleIdentifier(m_table, bundleID) != nullptr;
}
