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

/// Makes the menu window as the interface file describes it. Main thread only.
class SMMenuWindowMaker {
public:
    explicit SMMenuWindowMaker(const SMMenuWindowServices& services)
        : m_services(services) {}

    /// Loads the form of the next window and paints it once, unseen: without a controller, and without the
    /// time that this takes in the click that opens the window.
    void prepare(SMMenuWindowOwner& owner);
    /// With its controller, hidden at first. The owner must outlive it.
    std::unique_ptr<SMMenuWindow> make(SMMenuWindowOwner& owner);

private:
    SMMenuWindowServices m_services;
    std::unique_ptr<SMMenuWindowOutlets> m_prepared;
};
