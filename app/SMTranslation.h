#pragma once

/// Makes the menu speak the language of the user's session, and face the way that it is written. Once, with
/// an application object, before anything shows text. Where a language is missing, English stands in.
void SMLoadTranslations();
