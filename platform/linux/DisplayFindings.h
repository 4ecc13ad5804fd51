#pragma once

#include "platform/Findings.h"

namespace platform {

/// Whether the X server that the environment names takes a connection. Needs no application object; the
/// toolkit ends the process when it finds none.
bool DisplayAnswers();

/// Looks around. With an application object on the display, if that answers.
DisplayFindings LookAtDisplay();

} // namespace platform
