#pragma once

#include "platform/DistributedNotificationCenter.h"
#include "platform/linux/Descriptor.h"
#include "platform/linux/NoticeObservers.h"

namespace platform {

/// Notices through a directory: posting one moves a fresh file onto its name, and everybody watches for that.
class InotifyNotificationCenter final : public DistributedNotificationCenter {
public:
    /// `directory` is that of the ports. The loop must outlive the centre.
    InotifyNotificationCenter(MainLoop& mainLoop, const std::string& directory);

    void post(const std::string& name) override;
    void postLocally(const std::string& name) override;
    std::unique_ptr<Handle> observe(const std::string& name, std::function<void()> handler) override;

private:
    void deliver();

    MainLoop& m_mainLoop;
    std::shared_ptr<NoticeObservers> m_observers = std::make_shared<NoticeObservers>();
    Descriptor m_notices;
    Descriptor m_inotify;
    std::unique_ptr<Handle> m_watch;
    unsigned m_posted = 0;
};

} // namespace platform
