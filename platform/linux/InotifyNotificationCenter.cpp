#include "platform/linux/InotifyNotificationCenter.h"

#include "lib/base/Log.h"
#include "platform/MainLoop.h"
#include "platform/linux/PortLeftovers.h"
#include "platform/linux/PrivateDirectory.h"

#include <array>
#include <cerrno>
#include <cstring>
#include <ctime>
#include <fcntl.h>
#include <functional>
#include <memory>
#include <stdio.h>
#include <string>
#include <sys/inotify.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>
#include <vector>

namespace platform {

namespace {

struct Notices {
    std::vector<std::string> names; ///< equal neighbours merged
    bool areLost = false;
};

/// Files of those who ended while they posted: nobody else takes so long to rename one.
void RemoveAbandoned(int directory) {
    constexpr std::time_t longest = 60;
    for (const auto& name : EntriesOf(directory)) {
        struct stat status = {};
        const bool isFile =
            fstatat(directory, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0 && S_ISREG(status.st_mode);
        if (isFile && name.starts_with('.') && std::time(nullptr) - status.st_mtim.tv_sec > longest)
            unlinkat(directory, name.c_str(), 0);
    }
}

Notices ReadNotices(int inotify) {
    Notices notices;
    alignas(inotify_event) std::array<char, 4096> buffer;
    for (;;) {
        const auto length = read(inotify, buffer.data(), buffer.size());
        if (length <= 0) return notices;
        for (std::size_t offset = 0; offset < static_cast<std::size_t>(length);) {
            const auto* event = reinterpret_cast<const inotify_event*>(buffer.data() + offset);
            offset += sizeof *event + event->len;
            if ((event->mask & IN_Q_OVERFLOW) != 0) notices.areLost = true;
            if (event->len == 0) continue;
            const std::string name = event->name; // ends before the padding
            if (notices.names.empty() || notices.names.back() != name) notices.names.push_back(name);
        }
    }
}

} // namespace

InotifyNotificationCenter::InotifyNotificationCenter(MainLoop& mainLoop, const std::string& directory)
    : m_mainLoop(mainLoop) {
    const auto parent = OpenPrivateDirectory(AT_FDCWD, directory);
    if (parent) m_notices = OpenPrivateDirectory(parent.get(), "notices");
    if (!m_notices) return;
    RemoveAbandoned(m_notices.get());
    m_inotify.reset(inotify_init1(IN_CLOEXEC | IN_NONBLOCK));
    const auto path = PathInDirectory(m_notices.get(), ".");
    if (!m_inotify || inotify_add_watch(m_inotify.get(), path.c_str(), IN_MOVED_TO | IN_ONLYDIR) < 0) {
        Log("IPC: %s: unable to watch for notices: %s\n", "InotifyNotificationCenter", std::strerror(errno));
        return;
    }
    m_watch = m_mainLoop.watchReadable(m_inotify.get(), [this] { deliver(); });
}

void InotifyNotificationCenter::post(const std::string& name) {
    if (!m_notices || !IsPortName(name)) return;
    const auto temporary = '.' + std::to_string(getpid()) + '.' + std::to_string(++m_posted);
    constexpr int flags = O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC | O_NOFOLLOW;
    const Descriptor file(openat(m_notices.get(), temporary.c_str(), flags, S_IRUSR | S_IWUSR));
    if (!file || renameat(m_notices.get(), temporary.c_str(), m_notices.get(), name.c_str()) != 0)
        Log("IPC: %s: unable to post %s: %s\n", "InotifyNotificationCenter", name.c_str(),
            std::strerror(errno));
}

void InotifyNotificationCenter::postLocally(const std::string& name) {
    m_mainLoop.post([name, weak = std::weak_ptr(m_observers)] {
        if (const auto observers = weak.lock()) observers->deliver(name);
    });
}

std::unique_ptr<Handle> InotifyNotificationCenter::observe(const std::string& name,
                                                           std::function<void()> handler) {
    return m_observers->add(name, std::move(handler));
}

void InotifyNotificationCenter::deliver() {
    const auto notices = ReadNotices(m_inotify.get());
    const auto observers = m_observers; // a handler may end the centre
    // Nobody knows which were lost: a notice too many does no harm, one too few does.
    if (notices.areLost) return observers->deliverAll();
    for (const auto& name : notices.names)
        observers->deliver(name);
}

} // namespace platform
