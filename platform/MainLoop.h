#pragma once

#include <chrono>
#include <functional>
#include <memory>

namespace platform {

/// Something that goes on until its handle is destroyed. A handle may be destroyed from inside its own
/// callback.
class Handle {
public:
    virtual ~Handle() = default;
};

/// The loop of the main thread. Everything but `post` is for that thread alone, and every callback runs on
/// it.
class MainLoop {
public:
    using Task = std::function<void()>;
    using Milliseconds = std::chrono::milliseconds;

    virtual ~MainLoop() = default;

    /// Runs the task in a later turn of the loop, after all that was posted before it. Any thread.
    virtual void post(Task task) = 0;

    /// Runs the task after `delay`; with an `interval` above zero, again and again from then on.
    [[nodiscard]] virtual std::unique_ptr<Handle> startTimer(Milliseconds delay, Milliseconds interval,
                                                             Task task) = 0;

    /// Runs the task whenever the descriptor has something to read. The descriptor stays the caller's, and
    /// must outlive the handle: once it is closed, its number may be another's, who would no longer be heard.
    /// So where both are members, the handle is declared after the descriptor.
    [[nodiscard]] virtual std::unique_ptr<Handle> watchReadable(int descriptor, Task task) = 0;
};

} // namespace platform
