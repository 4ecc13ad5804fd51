#pragma once

#include <string>

/// What can be found out of the system that the programs run on. Values only.
namespace platform {

struct DisplayFindings {
    std::string name; ///< of the X server; empty for none
    bool answers = false;
    bool isUnderWayland = false;
    std::string sessionType;
    std::string desktop;
    std::string windowManager; ///< empty when none says its name
    bool hasTray = false;
    bool hasNotifierHost = false;
    bool isCompositing = false;
    bool blursBehind = false;
    std::string busFault; ///< empty when the session bus answers
};

/// A file or directory, and why it cannot be used; empty when it can.
struct PlaceFinding {
    std::string path;
    std::string fault;
};

} // namespace platform
