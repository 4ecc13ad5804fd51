#pragma once

#include "platform/linux/HostedStatusBar.h"
#include "platform/linux/NotifierHost.h"

namespace platform {

/// The bars that take status notifier items over the session bus: ours says where it was clicked, and its
/// frame is worked out from that. Pictures of the view, in several sizes, stand for the view.
class NotifierStatusBar final : public HostedStatusBar {
public:
    NotifierStatusBar();
    std::unique_ptr<StatusItem> addItem(float length, StatusItemView& view) override;

private:
    NotifierHost m_watched;
};

} // namespace platform
