#pragma once

#include "lib/base/Geometry.h"

/// The menu window as the application controller sees it.
class SMMenuWindow {
public:
    virtual ~SMMenuWindow() = default;
    virtual bool isVisible() const = 0;
    /// In screen coordinates, y upwards.
    virtual KXRect frame() const = 0;
    virtual void setFrame(KXRect frame) = 0;
    /// Identity of the window in its notifications.
    virtual const void* window() const = 0;

    virtual void reloadData() = 0;
    virtual void updateWindowHeight() = 0;
    virtual void showMenuWindow() = 0;
    virtual void hideMenuWindow() = 0;
};

/// Posted on the default notification centre, object the window's identity, when it loses the keyboard.
inline constexpr const char* SMWindowDidResignKeyNotification = "NSWindowDidResignKeyNotification";
