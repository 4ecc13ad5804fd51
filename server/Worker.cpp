#include "server/Worker.h"

#include "platform/MainLoop.h"

#include <mutex>
#include <stop_token>
#include <utility>

namespace tessel {

Worker::Worker(platform::MainLoop& mainLoop)
    : m_mainLoop(mainLoop)
    , m_thread([this](const std::stop_token& stop) { work(stop); }) {}

Worker::~Worker() {
    *m_alive = false;
    m_thread.request_stop();
    m_thread.join();
}

void Worker::run(Job job) {
    {
        const std::lock_guard lock(m_mutex);
        m_jobs.push_back(std::move(job));
    }
    m_wakeUp.notify_one();
}

void Worker::work(const std::stop_token& stop) {
    std::unique_lock lock(m_mutex);
    while (m_wakeUp.wait(lock, stop, [this] { return !m_jobs.empty(); }) && !stop.stop_requested()) {
        Job job = std::move(m_jobs.front());
        m_jobs.pop_front();
        lock.unlock();
        m_mainLoop.post([alive = m_alive, answer = job()] {
            if (*alive) answer();
        });
        job = nullptr; // what it holds goes before the next wait
        lock.lock();
    }
}

} // namespace tessel
