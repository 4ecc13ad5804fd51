#pragma once

#include "platform/MainLoop.h"

#include <condition_variable>
#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <thread>

namespace tessel {

/// Runs a job off the main thread, one after the other, and then what the job answered on the main thread.
using Job = std::function<std::function<void()>()>;
using Executor = std::function<void(Job)>;

/// The thread behind an executor. Its end waits for the running job, drops the waiting ones, and runs no
/// answer any more. Main thread only.
class Worker {
public:
    explicit Worker(platform::MainLoop& mainLoop);
    ~Worker();
    Worker(const Worker&) = delete;
    Worker& operator=(const Worker&) = delete;

    void run(Job job);

private:
    void work(const std::stop_token& stop);

    platform::MainLoop& m_mainLoop;
    std::shared_ptr<bool> m_alive = std::make_shared<bool>(true); // read on the main thread alone
    std::mutex m_mutex;
    std::condition_variable_any m_wakeUp;
    std::deque<Job> m_jobs;
    std::jthread m_thread; // last: starts when all else stands
};

} // namespace tessel
