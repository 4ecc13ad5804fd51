#include "platform/linux/ProcProcessTable.h"

#include "platform/Clock.h"
#include "platform/MainLoop.h"
#include "platform/ProcessTable.h"
#include "platform/linux/Descriptor.h"
#include "platform/linux/ProcRecords.h"

#include <algorithm>
#include <atomic>
#include <csignal>
#include <cstdint>
#include <cstdlib>
#include <functional>
#include <iterator>
#include <memory>
#include <optional>
#include <pthread.h>
#include <signal.h>
#include <string>
#include <string_view>
#include <sys/syscall.h>
#include <unistd.h>
#include <utility>
#include <vector>

namespace platform {

namespace {

/// Ten seconds of the kernel's usual 100 ticks: by then whoever started an application is done with it.
constexpr std::uint64_t ticksToSettle = 1000;

/// The directories of a search path, or of `fallback` when the variable is not set.
std::vector<std::string> DirectoriesOf(const char* variable, const std::string& fallback) {
    const char* value = std::getenv(variable);
    std::string_view rest = value != nullptr && *value != 0 ? std::string_view(value) : fallback;
    std::vector<std::string> directories;
    while (!rest.empty()) {
        const auto end = std::min(rest.find(':'), rest.size());
        if (rest.starts_with('/')) directories.emplace_back(rest.substr(0, end));
        rest.remove_prefix(std::min(end + 1, rest.size()));
    }
    return directories;
}

/// Without a call of the system: every message asks, and a call takes as long as writing a small one.
int CurrentProcessID() {
    static std::atomic<int> known = [] {
        pthread_atfork(nullptr, nullptr, [] { known = getpid(); });
        return getpid();
    }();
    return known;
}

int ProcessIDOf(ProcessSerialNumber process) {
    return static_cast<int>(process.lowLongOfPSN);
}

ProcessSerialNumber SerialNumber(int pid, const ProcStat& stat) {
    return {static_cast<std::uint32_t>(stat.startTicks), static_cast<std::uint32_t>(pid)};
}

/// Calls its handler when the process's descriptor becomes readable, and then never again.
class ExitWatch final : public Handle {
public:
    ExitWatch(MainLoop& mainLoop, Descriptor process, std::function<void()> handler)
        : m_process(std::move(process))
        , m_handler(std::move(handler))
        , m_watch(mainLoop.watchReadable(m_process.get(), [this] { fire(); })) {}

private:
    void fire() {
        m_watch.reset();
        // The handler may end this object.
        const auto handler = std::move(m_handler);
        handler();
    }

    Descriptor m_process;
    std::function<void()> m_handler;
    std::unique_ptr<Handle> m_watch; ///< ends before the descriptor
};

} // namespace

ProcProcessTable::Places ProcProcessTable::Places::fromEnvironment() {
    const char* home = std::getenv("HOME");
    Places places;
    places.dataDirectories =
        DirectoriesOf("XDG_DATA_HOME", home != nullptr ? std::string(home) + "/.local/share" : "");
    std::ranges::move(DirectoriesOf("XDG_DATA_DIRS", "/usr/local/share:/usr/share"),
                      std::back_inserter(places.dataDirectories));
    places.programDirectories = DirectoriesOf("PATH", "/usr/local/bin:/usr/bin:/bin");
    return places;
}

ProcProcessTable::ProcProcessTable(MainLoop& mainLoop, const Clock& clock, const Places& places)
    : m_mainLoop(mainLoop)
    , m_processes(places.proc)
    , m_applications(m_processes, clock, places.dataDirectories, places.programDirectories) {}

std::optional<ProcessSerialNumber> ProcProcessTable::currentProcess() const {
    // Reading its record again would cost more than sending a message.
    const auto pid = static_cast<std::uint32_t>(CurrentProcessID());
    const auto known = m_current.load();
    if (static_cast<std::uint32_t>(known) == pid)
        return ProcessSerialNumber{static_cast<std::uint32_t>(known >> 32), pid};
    const auto current = serialNumberOf(static_cast<int>(pid));
    if (current) m_current = std::uint64_t{current->highLongOfPSN} << 32 | pid;
    return current;
}

std::optional<ProcessSerialNumber> ProcProcessTable::serialNumberOf(int pid) const {
    const auto stat = m_processes.stat(pid);
    return stat ? std::optional(SerialNumber(pid, *stat)) : std::nullopt;
}

std::optional<ProcessInfo> ProcProcessTable::nextProcess(ProcessSerialNumber after) const {
    if (after == ProcessSerialNumber{} || m_walk.empty()) startWalk();
    const auto first = std::ranges::upper_bound(m_walk, ProcessIDOf(after), {}, &ProcDirectory::Entry::pid);
    for (auto entry = first; entry != m_walk.end(); ++entry)
        if (auto info = infoOf(*entry)) return info;
    return {};
}

void ProcProcessTable::startWalk() const {
    m_walk = m_processes.entries();
    m_walkTicks = m_processes.ticksSinceBoot().value_or(0);
    std::erase_if(m_known, [&](const auto& known) {
        return !std::ranges::binary_search(m_walk, known.first, {}, &ProcDirectory::Entry::pid);
    });
}

std::optional<ProcessInfo> ProcProcessTable::infoOf(ProcDirectory::Entry entry) const {
    const auto before = m_known.find(entry.pid);
    // One look instead of several: what has ended runs no program, and who may not look has no name for it.
    if (before != m_known.end() && before->second.entry == entry.number &&
        m_processes.executable(entry.pid) == before->second.evidence.executable)
        return infoOf(entry.pid, before->second);
    const auto stat = m_processes.isOfUser(entry.pid) ? m_processes.stat(entry.pid) : std::nullopt;
    if (!stat) return {};
    auto& known = knowledgeOf(entry.pid, *stat);
    const auto& evidence = known.evidence;
    known.entry =
        known.isSettled && !evidence.executable.empty() && !evidence.hasParentInUnit ? entry.number : 0;
    return infoOf(entry.pid, known);
}

std::optional<ProcessInfo> ProcProcessTable::info(ProcessSerialNumber process) const {
    const int pid = ProcessIDOf(process);
    const auto stat = m_processes.stat(pid);
    if (!stat || SerialNumber(pid, *stat) != process) return {};
    return infoOf(pid, knowledgeOf(pid, *stat));
}

ProcessInfo ProcProcessTable::infoOf(int pid, const Known& known) const {
    ProcessInfo info;
    info.serialNumber = SerialNumber(pid, known.stat);
    info.executablePath = known.evidence.executable;
    auto application = m_applications.applicationOf(known.evidence);
    info.isBackgroundOnly = !application;
    if (!application) return info;
    info.bundleIdentifier = std::move(application->id);
    info.bundlePath = std::move(application->entryPath);
    info.isUIElement = application->noDisplay;
    return info;
}

ProcProcessTable::Known& ProcProcessTable::knowledgeOf(int pid, const ProcStat& stat) const {
    auto& known = m_known[pid];
    const bool isSame = known.isSettled && known.stat.startTicks == stat.startTicks &&
                        known.stat.parent == stat.parent &&
                        known.evidence.executable == m_processes.executable(pid);
    if (isSame) return known;
    // Also with a clock of its own, as in a container: then a process may seem to start in the future.
    const bool isSettled = m_walkTicks > stat.startTicks + ticksToSettle;
    known = {stat, isSettled, m_applications.evidenceOf(pid, stat.parent)};
    return known;
}

bool ProcProcessTable::terminate(ProcessSerialNumber process) {
    return send(process, SIGTERM);
}

bool ProcProcessTable::kill(ProcessSerialNumber process) {
    return send(process, SIGKILL);
}

/// Through a descriptor, so that the signal never reaches another process with the same id.
bool ProcProcessTable::send(ProcessSerialNumber process, int signal) const {
    const auto opened = open(process);
    return opened && syscall(SYS_pidfd_send_signal, opened.get(), signal, nullptr, 0) == 0;
}

std::unique_ptr<Handle> ProcProcessTable::watchExit(ProcessSerialNumber process,
                                                    std::function<void()> handler) {
    auto opened = open(process);
    if (!opened) return nullptr;
    return std::make_unique<ExitWatch>(m_mainLoop, std::move(opened), std::move(handler));
}

/// A descriptor of the process; none when it has ended.
Descriptor ProcProcessTable::open(ProcessSerialNumber process) const {
    const int pid = ProcessIDOf(process);
    Descriptor opened(static_cast<int>(syscall(SYS_pidfd_open, pid, 0)));
    // Only now: before, the id could still have gone to another process.
    if (opened && serialNumberOf(pid) != process) opened.reset();
    return opened;
}

} // namespace platform
