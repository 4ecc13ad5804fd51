#include "app/menuHomeList.h"

#include "app/SMMenuItem.h"
#include "app/SMMenuModel.h"

#include <algorithm>
#include <cmath>
#include <cstddef>

namespace {

constexpr float maximumRows = 11;

} // namespace

float menuWindowHeight(float windowHeight, float rightBoxHeight, float visibleHeight) {
    const float base = windowHeight - rightBoxHeight + 3 * menuPaneMargin;
    const float rows = std::clamp(std::trunc((visibleHeight - base) / menuRowHeight), 1.0F, maximumRows);
    return base + menuRowHeight * rows;
}

SMMenuItems pinnedAndFrequentlyUsedApps(const SMMenuModel& model, float rightBoxHeight) {
    const static SMMenuItems none;
    const SMMenuItems& pinned = model.pinnedApps ? *model.pinnedApps : none;
    const SMMenuItems& frequent = model.frequentlyUsedApps ? *model.frequentlyUsedApps : none;
    const float room = std::max(0.0F, std::trunc((rightBoxHeight - 2 * menuPaneMargin) / menuRowHeight));
    const auto max = static_cast<std::size_t>(room);

    SMMenuItems items;
    items.reserve(max + 1);
    const auto taken = static_cast<std::ptrdiff_t>(std::min(pinned.size(), max));
    items.assign(pinned.begin(), pinned.begin() + taken);
    const std::size_t left = max - items.size();
    if (left < 1 || frequent.empty()) return items;

    if (!pinned.empty()) items.push_back(SMMenuItem::separatorItem());
    const auto sorted = static_cast<std::ptrdiff_t>(items.size());
    items.insert(items.end(), frequent.begin(),
                 frequent.begin() + static_cast<std::ptrdiff_t>(std::min(left, frequent.size())));
    std::stable_sort(items.begin() + sorted, items.end(),
                     [](const auto& a, const auto& b) { return a->titleCompare(*b) < 0; });
    return items;
}
