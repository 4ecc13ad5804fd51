#pragma once

#include "platform/ProcessTable.h"

#include <string>

/// Questions to the desktop's session. Main thread only; the table must outlive it.
class KXWorkspace {
public:
    explicit KXWorkspace(platform::ProcessTable& table)
        : m_table(table) {}
    /// Exact and case-sensitive.
    bool isAppWithBundleIdentifierRunning(const std::string& bundleID) const;

private:
    platform::ProcessTable& m_table;
};
