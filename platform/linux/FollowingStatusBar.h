#pragma once

#include "platform/MainLoop.h"
#include "platform/linux/HostedStatusBar.h"

#include <cstddef>
#include <span>
#include <vector>

namespace platform {

/// A bar, by its index, and the host of it.
struct StatusItemPlace {
    std::size_t bar = 0;
    std::uint64_t host = 0;
    friend bool operator==(const StatusItemPlace&, const StatusItemPlace&) = default;
};

/// The first bar that has a host, given the hosts of all; with none, the place after the last.
StatusItemPlace ChooseStatusItemPlace(std::span<const std::uint64_t> hosts);

/// The bar of whichever host the desktop has at the time. Its items move when hosts appear, die or restart,
/// and draw the same view wherever they are. An item shows soon after it was added, not at once: hosts take a
/// moment to be found.
class FollowingStatusBar final : public StatusBar {
public:
    /// The bars in order of preference. All borrowed.
    FollowingStatusBar(MainLoop& mainLoop, std::vector<HostedStatusBar*> bars, StatusBar& barWithoutHost);
    ~FollowingStatusBar() override;
    FollowingStatusBar(const FollowingStatusBar&) = delete;
    FollowingStatusBar& operator=(const FollowingStatusBar&) = delete;

    float thickness() const override { return m_barWithoutHost.thickness(); }
    std::unique_ptr<StatusItem> addItem(float length, StatusItemView& view) override;

private:
    class Item;

    void settle();
    void moveItems();
    StatusBar& barAt(std::size_t index);

    MainLoop& m_mainLoop;
    std::vector<HostedStatusBar*> m_bars;
    StatusBar& m_barWithoutHost;
    std::vector<Item*> m_items;
    std::unique_ptr<Handle> m_settling;
};

} // namespace platform
