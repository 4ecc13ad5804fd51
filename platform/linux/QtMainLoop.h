#pragma once

#include "platform/MainLoop.h"

#include <QObject>

namespace platform {

/// The main loop on the dispatcher of the thread that makes it. Made after the application object and ended
/// before it; tasks that still wait then are dropped. Handles may outlive it.
class QtMainLoop final : public MainLoop {
public:
    void post(Task task) override;
    [[nodiscard]] std::unique_ptr<Handle> startTimer(Milliseconds delay, Milliseconds interval,
                                                     Task task) override;
    [[nodiscard]] std::unique_ptr<Handle> watchReadable(int descriptor, Task task) override;

private:
    QObject m_context;
};

} // namespace platform
