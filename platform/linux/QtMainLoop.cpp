#include "platform/linux/QtMainLoop.h"

#include "platform/MainLoop.h"

#include <QPointer>
#include <QSocketNotifier>
#include <QTimer>
#include <memory>
#include <utility>

namespace platform {

namespace {

template <typename Source>
class SourceHandle final : public Handle {
public:
    SourceHandle(Source* source, void (*stop)(Source&))
        : m_source(source)
        , m_stop(stop) {}
    SourceHandle(const SourceHandle&) = delete;
    SourceHandle& operator=(const SourceHandle&) = delete;

    ~SourceHandle() override {
        if (!m_source) return;
        m_stop(*m_source);
        m_source->disconnect();
        // Not deleted here: we may be inside its signal.
        m_source->deleteLater();
    }

private:
    QPointer<Source> m_source;
    void (*m_stop)(Source&);
};

} // namespace

void QtMainLoop::post(Task task) {
    QMetaObject::invokeMethod(&m_context, std::move(task), Qt::QueuedConnection);
}

std::unique_ptr<Handle> QtMainLoop::startTimer(Milliseconds delay, Milliseconds interval, Task task) {
    auto* timer = new QTimer(&m_context);
    timer->setTimerType(Qt::PreciseTimer);
    timer->setSingleShot(interval <= Milliseconds::zero());
    QObject::connect(timer, &QTimer::timeout, timer, [timer, interval, task = std::move(task)] {
        if (!timer->isSingleShot() && timer->intervalAsDuration() != interval) timer->setInterval(interval);
        task();
    });
    timer->start(delay);
    return std::make_unique<SourceHandle<QTimer>>(timer, [](QTimer& source) { source.stop(); });
}

std::unique_ptr<Handle> QtMainLoop::watchReadable(int descriptor, Task task) {
    auto* notifier = new QSocketNotifier(descriptor, QSocketNotifier::Read, &m_context);
    QObject::connect(notifier, &QSocketNotifier::activated, notifier, [task = std::move(task)] { task(); });
    return std::make_unique<SourceHandle<QSocketNotifier>>(
        notifier, [](QSocketNotifier& source) { source.setEnabled(false); });
}

} // namespace platform
