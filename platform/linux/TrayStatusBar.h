#pragma once

#include "platform/MainLoop.h"
#include "platform/linux/HostedStatusBar.h"

#include <QAbstractNativeEventFilter>

namespace platform {

/// The system tray of an X11 desktop: our own window inside of the host's, so that frame and presses are
/// true. A tray that does not take the first item in, or is a bridge that keeps it out of sight, counts as
/// none.
class TrayStatusBar final : public HostedStatusBar, private QAbstractNativeEventFilter {
public:
    explicit TrayStatusBar(MainLoop& mainLoop);
    ~TrayStatusBar() override;
    TrayStatusBar(const TrayStatusBar&) = delete;
    TrayStatusBar& operator=(const TrayStatusBar&) = delete;

    std::unique_ptr<StatusItem> addItem(float length, StatusItemView& view) override;

private:
    class Item;

    bool nativeEventFilter(const QByteArray& eventType, void* message, qintptr* result) override;
    void lookForTray();

    MainLoop& m_mainLoop;
    std::uint32_t m_tray = 0;
};

} // namespace platform
