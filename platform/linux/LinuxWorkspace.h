#pragma once

#include "lib/kxAppKit/system/KXWorkspace.h"
#include "platform/ProcessTable.h"
#include "platform/linux/DockDefaults.h"
#include "platform/linux/EwmhWorkspace.h"
#include "platform/linux/GioLaunchServices.h"
#include "platform/linux/LogindSession.h"

namespace platform {

/// What a workspace stands on beside processes, for a program's `main`. Asks the desktop nothing until it is
/// asked itself. The process table must outlive it.
class LinuxWorkspace {
public:
    explicit LinuxWorkspace(ProcessTable& processes)
        : m_processes(processes) {}

    KXWorkspace::Services services() { return {m_processes, m_windows, m_session, m_dock, m_launching}; }

private:
    ProcessTable& m_processes;
    EwmhWorkspace m_windows;
    LogindSession m_session;
    DockDefaults m_dock{[this] { return m_windows.desktopGrid(); }};
    GioLaunchServices m_launching;
};

} // namespace platform
