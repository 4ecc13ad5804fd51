#include "platform/linux/TerminationSignals.h"

#include "platform/MainLoop.h"

#include <array>
#include <cerrno>
#include <csignal>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <signal.h>
#include <sys/eventfd.h>
#include <unistd.h>
#include <utility>

namespace platform {

namespace {

constexpr std::array terminationSignals = {SIGTERM, SIGINT, SIGHUP};

// A handler of signals reaches nothing but globals. Blocking the signals and reading a signalfd would look
// better, but every program that is started would inherit the block.
// NOLINTBEGIN(*-avoid-non-const-global-variables)
int wakeUp = -1;
std::array<struct sigaction, terminationSignals.size()> previousActions;
// NOLINTEND(*-avoid-non-const-global-variables)

void onSignal(int) {
    const int error = errno;
    const std::uint64_t one = 1;
    [[maybe_unused]] const auto written = write(wakeUp, &one, sizeof one);
    errno = error;
}

} // namespace

TerminationSignals::TerminationSignals(MainLoop& mainLoop, std::function<void()> handler) {
    wakeUp = eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK);
    if (wakeUp < 0) return;
    m_watch = mainLoop.watchReadable(wakeUp, [handler = std::move(handler)] {
        std::uint64_t count = 0;
        if (read(wakeUp, &count, sizeof count) == sizeof count) handler();
    });
    struct sigaction action {};
    action.sa_handler = onSignal;
    action.sa_flags = SA_RESTART;
    for (std::size_t i = 0; i < terminationSignals.size(); ++i)
        sigaction(terminationSignals[i], &action, &previousActions[i]);
}

TerminationSignals::~TerminationSignals() {
    if (wakeUp < 0) return;
    for (std::size_t i = 0; i < terminationSignals.size(); ++i)
        sigaction(terminationSignals[i], &previousActions[i], nullptr);
    m_watch.reset();
    close(std::exchange(wakeUp, -1));
}

} // namespace platform
