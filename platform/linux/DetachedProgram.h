#pragma once

#include "platform/Status.h"
#include "platform/linux/ExecLine.h"

#include <string>
#include <vector>

namespace platform {

struct DetachedStart {
    Status status = status::success;
    std::string reason; ///< why not, for people
    int pid = 0;
};

/// Executes a command as a child of nobody, in a directory, or in ours when that is empty. Waits until the
/// program runs or cannot be executed. `variables` ("NAME=value") are added to our environment, less what
/// others told us of our own start. Every "GIO_LAUNCHED_DESKTOP_FILE" gets its companion with the program's
/// id.
DetachedStart StartDetached(const Command& command, const std::string& directory,
                            const std::vector<std::string>& variables);

} // namespace platform
