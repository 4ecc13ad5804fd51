#include "platform/linux/FollowingStatusBar.h"

#include "lib/base/Geometry.h"
#include "platform/MainLoop.h"
#include "platform/StatusBar.h"
#include "platform/linux/HostedStatusBar.h"

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <memory>
#include <optional>
#include <span>
#include <utility>
#include <vector>

namespace platform {

namespace {

// A host that restarts, and one that brings two kinds of bar, changes several things in a row.
constexpr auto settlingTime = std::chrono::milliseconds(150);

} // namespace

class FollowingStatusBar::Item final : public StatusItem {
public:
    Item(FollowingStatusBar& bar, float length, StatusItemView& view)
        : m_bar(bar)
        , m_length(length)
        , m_view(view) {
        m_bar.m_items.push_back(this);
    }
    ~Item() override { std::erase(m_bar.m_items, this); }
    Item(const Item&) = delete;
    Item& operator=(const Item&) = delete;

    void moveTo(StatusItemPlace place) {
        if (place == m_place) return;
        m_place = place;
        m_item.reset(); // before the next: no moment with two
        m_item = m_bar.barAt(place.bar).addItem(m_length, m_view);
    }

    void setNeedsDisplay() override {
        if (m_item) m_item->setNeedsDisplay();
    }
    KXRect frame() const override { return m_item ? m_item->frame() : KXRect{}; }

private:
    FollowingStatusBar& m_bar;
    float m_length;
    StatusItemView& m_view;
    std::optional<StatusItemPlace> m_place;
    std::unique_ptr<StatusItem> m_item;
};

StatusItemPlace ChooseStatusItemPlace(std::span<const std::uint64_t> hosts) {
    const auto first = std::ranges::find_if(hosts, [](std::uint64_t host) { return host != 0; });
    const auto bar = static_cast<std::size_t>(std::distance(hosts.begin(), first));
    return {bar, first == hosts.end() ? 0 : *first};
}

FollowingStatusBar::FollowingStatusBar(MainLoop& mainLoop, std::vector<HostedStatusBar*> bars,
                                       StatusBar& barWithoutHost)
    : m_mainLoop(mainLoop)
    , m_bars(std::move(bars))
    , m_barWithoutHost(barWithoutHost) {
    for (auto* bar : m_bars)
        bar->setHostChanged([this] { settle(); });
}

FollowingStatusBar::~FollowingStatusBar() {
    for (auto* bar : m_bars)
        bar->setHostChanged({});
}

std::unique_ptr<StatusItem> FollowingStatusBar::addItem(float length, StatusItemView& view) {
    auto item = std::make_unique<Item>(*this, length, view);
    settle();
    return item;
}

void FollowingStatusBar::settle() {
    // Not begun anew by a further change: a host that flutters must not keep the item away.
    if (m_settling) return;
    m_settling = m_mainLoop.startTimer(settlingTime, {}, [this] {
        m_settling.reset();
        moveItems();
    });
}

void FollowingStatusBar::moveItems() {
    std::vector<std::uint64_t> hosts;
    std::ranges::transform(m_bars, std::back_inserter(hosts), &HostedStatusBar::host);
    for (auto* item : m_items)
        item->moveTo(ChooseStatusItemPlace(hosts));
}

StatusBar& FollowingStatusBar::barAt(std::size_t index) {
    return index < m_bars.size() ? *m_bars[index] : m_barWithoutHost;
}

} // namespace platform
