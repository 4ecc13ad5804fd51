#pragma once

#include "platform/Status.h"

namespace platform {

/// Which windows of a process.
enum class ProcessWindows { all, frontOne };

/// The windows and desktops of everybody, as the display's window manager tells of them. Main thread only;
/// each call asks afresh.
class Workspace {
public:
    virtual ~Workspace() = default;

    /// The id of the process whose window has the keyboard; 0 when there is none, or nobody tells.
    virtual int frontProcessID() const = 0;

    /// Asks the window manager to raise windows of a process and to give the keyboard to its front one.
    virtual Status bringToFront(int pid, ProcessWindows windows) const = 0;

    /// The desktop that is shown, counted from 0.
    virtual Status currentDesktop(unsigned& number) const = 0;
};

} // namespace platform
