#include "app/doctorReport.h"

#include "platform/Findings.h"

#include <cstddef>
#include <string>

namespace {

struct Row {
    const char* name;
    std::string found;
    const char* help = nullptr; ///< there is a fault when there is one
};

const char* helpUnless(bool isWell, const char* help) {
    return isWell ? nullptr : help;
}

std::string placeText(const platform::PlaceFinding& place) {
    return place.fault.empty() ? place.path : place.path + ": " + place.fault;
}

Row displayRow(const platform::DisplayFindings& display) {
    const Row none{"display", "none: $DISPLAY is not set",
                   "Start the menu inside of a desktop's session; under Wayland install Xwayland."};
    if (display.name.empty()) return none;
    if (!display.answers)
        return {"display", "X server " + display.name + " does not answer",
                "Is $DISPLAY that of your session, and may you use it (xauth list)?"};
    const auto manager =
        display.windowManager.empty() ? "no window manager" : "window manager " + display.windowManager;
    return {"display", "X server " + display.name + ", " + manager};
}

std::string trayText(const platform::DisplayFindings& display) {
    if (display.hasTray) return "X11 system tray";
    if (display.hasNotifierHost) return "bar for status notifier items";
    return "none: the item stands in a strip of its own";
}

std::string blurText(const platform::DisplayFindings& display) {
    if (display.blursBehind) return "by the compositor";
    if (display.isUnderWayland) return "none: programs may not see the screen here";
    return display.isCompositing ? "of a picture of the screen, with a compositor"
                                 : "of a picture of the screen, without a compositor";
}

std::string sessionText(const platform::DisplayFindings& display) {
    std::string text = display.isUnderWayland ? "Wayland, through its X server" : "X11";
    if (!display.sessionType.empty()) text += ", type " + display.sessionType;
    if (!display.desktop.empty()) text += ", desktop " + display.desktop;
    return text;
}

std::string directoryText(const SMFindings& findings) {
    return placeText(findings.portDirectory) +
           (findings.hasRuntimeVariable ? "" : " ($XDG_RUNTIME_DIR is not set)");
}

} // namespace

SMDoctorReport SMReportOf(const SMFindings& findings) {
    const auto& display = findings.display;
    const bool mayWork = findings.library.fault.empty() && findings.processFault.empty();
    const Row rows[] = {
        displayRow(display),
        {"bus", display.busFault.empty() ? "session bus" : display.busFault,
         helpUnless(display.busFault.empty(),
                    "Bars of most desktops need it, and some applications do to start: install "
                    "dbus-user-session and log in anew, or start the desktop under dbus-run-session.")},
        {"tray host", trayText(display)},
        {"blur", blurText(display)},
        {"session", sessionText(display)},
        {"runtime directory", directoryText(findings),
         helpUnless(findings.portDirectory.fault.empty(),
                    "It must be yours alone, mode 700, or nothing is sent or received: remove it, and it is "
                    "made anew.")},
        {"agent", findings.agentRuns ? "runs" : "does not run"},
        {"server", findings.serverRuns ? "runs" : "does not run",
         helpUnless(findings.serverRuns, "Start tesselDaemon, which starts the menu too.")},
        {"permissions", findings.processFault.empty() ? placeText(findings.library) : findings.processFault,
         helpUnless(mayWork,
                    "The menu writes to ~/Library and watches your own processes in /proc: a sandbox "
                    "or a read-only home directory is in the way.")},
        {"log", placeText(findings.log),
         helpUnless(findings.log.fault.empty(),
                    "The menu works, but nothing is logged: make room, or give the file back to you.")},
    };
    SMDoctorReport report;
    constexpr std::size_t column = 19;
    for (const auto& row : rows) {
        const std::string name = row.name;
        const char* state = row.help ? "FAULT  " : "ok     ";
        report.text += name + std::string(column - name.size(), ' ') + state + row.found + '\n';
        if (!row.help) continue;
        report.text += std::string(column, ' ') + "       " + row.help + '\n';
        report.isHealthy = false;
    }
    return report;
}
