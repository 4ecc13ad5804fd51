#pragma once

#include <string>

namespace tessel {

/// A text of ours in the language of the session; itself, where there is no translation. It must be marked by
/// QT_TRANSLATE_NOOP("tesselDaemon", …) where it stands. Any thread.
std::string Localized(const char* text);

} // namespace tessel
