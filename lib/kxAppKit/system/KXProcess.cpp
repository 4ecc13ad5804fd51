#include "lib/kxAppKit/system/KXProcess.h"

#include "lib/base/Log.h"
#include "lib/kxAppKit/system/KXFileURL.h"
#include "lib/plist/Value.h"
#include "platform/ProcessTable.h"
#include "platform/Status.h"
#include "platform/Workspace.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace {

template <typename Predicate>
KXProcess::Pointer FirstProcess(platform::ProcessTable& table, const Predicate& matches) {
    auto processes = KXProcess::processEnumerator(table);
    while (auto process = processes.nextObject())
        if (matches(*process)) return process;
    return nullptr;
}

} // namespace

std::uint64_t KXNumberFromProcessSerialNumber(ProcessSerialNumber process) {
    return std::uint64_t{process.highLongOfPSN} << 32 | process.lowLongOfPSN;
}

ProcessSerialNumber KXProcessSerialNumberFromNumber(std::uint64_t number) {
    return {static_cast<std::uint32_t>(number >> 32), static_cast<std::uint32_t>(number)};
}

KXProcess::KXProcess(platform::ProcessTable& table, ProcessSerialNumber process,
                     std::optional<std::string> bundleIdentifier)
    : m_table(table)
    , m_psn(process)
    , m_bundleID(std::move(bundleIdentifier)) {}

KXProcess::~KXProcess() = default;

KXProcess::Pointer KXProcess::processWithSerialNumber(platform::ProcessTable& table,
                                                      ProcessSerialNumber process) {
    auto info = table.info(process);
    return std::make_shared<KXProcess>(table, process,
                                       info ? std::move(info->bundleIdentifier) : std::nullopt);
}

KXProcess::Pointer KXProcess::processWithBundleIdentifier(platform::ProcessTable& table,
                                                          std::string_view bundleID) {
    return FirstProcess(table,
                        [&](const KXProcess& process) { return process.bundleIdentifier() == bundleID; });
}

KXProcess::Pointer KXProcess::processWithURL(platform::ProcessTable& table, const std::string& url) {
    return FirstProcess(table, [&](const KXProcess& process) { return process.url() == url; });
}

KXProcess::Pointer KXProcess::currentProcess(platform::ProcessTable& table) {
    static Pointer cached;
    const auto current = table.currentProcess();
    if (!current) return nullptr;
    if (!cached || &cached->m_table != &table || cached->m_psn != *current)
        cached = processWithSerialNumber(table, *current);
    return cached;
}

KXProcess::Pointer KXProcess::activeProcess(platform::ProcessTable& table,
                                            const platform::Workspace& workspace) {
    const auto front = table.serialNumberOf(workspace.frontProcessID());
    return front ? processWithSerialNumber(table, *front) : nullptr;
}

KXProcessEnumerator KXProcess::processEnumerator(platform::ProcessTable& table) {
    return KXProcessEnumerator(table);
}

int KXProcess::pid() const {
    const int pid = static_cast<int>(m_psn.lowLongOfPSN);
    return m_table.serialNumberOf(pid) == m_psn ? pid : 0;
}

plist::Value KXProcess::info() const {
    const auto info = m_table.info(m_psn);
    if (!info) return {};
    plist::Dictionary dictionary{{"pid", m_psn.lowLongOfPSN},
                                 {"LSUIElement", info->isUIElement},
                                 {"LSBackgroundOnly", info->isBackgroundOnly}};
    if (!info->executablePath.empty()) dictionary.set("CFBundleExecutable", info->executablePath);
    if (info->bundleIdentifier) dictionary.set("CFBundleIdentifier", *info->bundleIdentifier);
    const auto& path = info->bundlePath ? *info->bundlePath : info->executablePath;
    if (!path.empty()) dictionary.set("BundlePath", path);
    return dictionary;
}

bool KXProcess::isValid() const {
    return pid() != 0;
}

std::optional<std::string> KXProcess::url() const {
    const auto path = info()["BundlePath"].string();
    return path ? KXFileURLOfPath(*path) : std::nullopt;
}

bool KXProcess::hasUI() const {
    const auto known = info();
    return !known["LSUIElement"].boolValue() && !known["LSBackgroundOnly"].boolValue();
}

bool KXProcess::isEqual(const KXProcess* other) const {
    return other != nullptr && other->m_psn == m_psn;
}

bool KXProcess::isActiveApplication(const platform::Workspace& workspace) const {
    return isEqual(activeProcess(m_table, workspace).get());
}

void KXProcess::activate(const platform::Workspace& workspace) const {
    bringToFront(workspace, platform::ProcessWindows::all, "-[KXProcess activate]");
}

void KXProcess::activateForFrontWindow(const platform::Workspace& workspace) const {
    bringToFront(workspace, platform::ProcessWindows::frontOne, "-[KXProcess activateForFrontWindow]");
}

void KXProcess::bringToFront(const platform::Workspace& workspace, platform::ProcessWindows windows,
                             const char* method) const {
    const int process = pid();
    const platform::Status error =
        process == 0 ? platform::status::processNotFound : workspace.bringToFront(process, windows);
    if (error != platform::status::success) Log("%s, Error: %d\n", method, error);
}

bool KXProcess::kill() {
    return m_table.kill(m_psn);
}

bool KXProcess::registerForProcessDeathNotification() {
    m_processDeathWatch = m_table.watchExit(m_psn, [this] { onProcessDeath(); });
    return m_processDeathWatch != nullptr;
}

void KXProcess::addObserverForProcessDeath(const void* owner, DeathHandler handler) {
    if (!m_processDeathWatch && !registerForProcessDeathNotification()) {
        Log("%s: unable to register, ignoring request\n",
            "-[KXProcess addObserverForProcessDeath:selector:]");
        return;
    }
    m_processDeathObservers.push_back(
        std::make_shared<DeathObserver>(DeathObserver{owner, std::move(handler)}));
}

void KXProcess::removeObserverForProcessDeath(const void* owner) {
    std::erase_if(m_processDeathObservers, [owner](const std::shared_ptr<DeathObserver>& observer) {
        return observer->removed = observer->owner == owner;
    });
    if (m_processDeathObservers.empty()) m_processDeathWatch.reset();
}

void KXProcess::onProcessDeath() {
    const auto self = weak_from_this().lock();
    m_processDeathWatch.reset();
    const auto observers = m_processDeathObservers;
    for (const auto& observer : observers)
        if (!observer->removed) observer->handler(*this);
}

KXProcess::Pointer KXProcessEnumerator::nextObject() {
    auto next = m_table.nextProcess(m_currentPSN);
    if (!next) return nullptr;
    m_currentPSN = next->serialNumber;
    return std::make_shared<KXProcess>(m_table, m_currentPSN, std::move(next->bundleIdentifier));
}
