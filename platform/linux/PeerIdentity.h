#pragma once

#include "platform/ProcessTable.h"

namespace platform {

/// Who a process id is, a zombie too: it may have sent before it ended. Nothing once it is gone.
std::optional<ProcessSerialNumber> SerialNumberOfPeer(int processID);

} // namespace platform
