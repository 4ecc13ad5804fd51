#pragma once

#include <QString>

namespace platform {

/// Makes the program speak the language of the user's session, and face the way that it is written. Once,
/// with an application object, before anything shows text. The texts are ":/i18n/<name>_<language>.qm"; where
/// a language is missing, English stands in.
void LoadTranslations(const QString& name);

} // namespace platform
