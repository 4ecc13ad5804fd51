#pragma once

#include "app/SMMenuWindow.h"
#include "app/SMMenuWindowController.h"
#include "app/SMMenuWindowOwner.h"

#include <memory>

namespace platform {
class UserDefaults;
class WindowServer;
} // namespace platform

/// What the menu window works on. Everything must outlive it.
struct SMMenuWindowServices {
    platform::WindowServer& windowServer;
    const platform::Clock& clock;
    platform::MainLoop& mainLoop;
    const platform::ModifierKeys& modifierKeys;
    const platform::UserDefaults& userDefaults;
};

/// The panel as the interface file describes it, without a controller.
std::unique_ptr<SMMenuWindowOutlets> SMLoadMenuWindow(const SMMenuWindowServices& services,
                                                      std::function<KXRect()> statusItemFrame);

/// The menu window with its controller, hidden at first.
std::unique_ptr<SMMenuWindow> SMMakeMenuWindow(SMMenuWindowOwner& owner,
                                               const SMMenuWindowServices& services);
