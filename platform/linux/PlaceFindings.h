#pragma once

#include "platform/Findings.h"

#include <string>

namespace platform {

/// Whether this user can write the file or directory: what there is of it, or else of those above, which it
/// would be made in. Changes nothing.
PlaceFinding LookForWriting(const std::string& path);

/// Why other processes of this user cannot be watched; empty when they can.
std::string ProcessWatchFault();

} // namespace platform
