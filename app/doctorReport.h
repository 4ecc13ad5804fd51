#pragma once

#include "platform/Findings.h"

#include <string>

/// All that the menu needs, as it was found.
struct SMFindings {
    platform::DisplayFindings display;
    bool hasRuntimeVariable = false;
    platform::PlaceFinding portDirectory;
    platform::PlaceFinding library; ///< where logs and settings are
    platform::PlaceFinding log;
    std::string processFault; ///< why other processes cannot be watched; empty when they can
    bool agentRuns = false;
    bool serverRuns = false;
};

struct SMDoctorReport {
    std::string text; ///< for people
    bool isHealthy = true;
};

/// A line for each thing, and after each fault a word of help. Pure.
SMDoctorReport SMReportOf(const SMFindings& findings);
