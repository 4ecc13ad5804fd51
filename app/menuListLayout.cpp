#include "app/menuListLayout.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <optional>
#include <span>

namespace {

/// The rows with the top separator and the scroll-up row put in before the first row that is shown.
class Arrangement {
public:
    Arrangement(std::span<const MenuListRow> rows, const MenuListState& state)
        : m_rows(rows)
        , m_first(state.scrollIndex) {
        if (state.topSeparatorHeight) m_extra[m_extraCount++] = *state.topSeparatorHeight;
        m_showsUp = scrollIndexUp(state).has_value();
        if (m_showsUp) m_extra[m_extraCount++] = state.scrollArrowHeight;
    }

    std::size_t size() const { return m_rows.size() + m_extraCount; }
    std::size_t first() const { return m_first; }
    bool showsUp() const { return m_showsUp; }

    MenuListRow operator[](std::size_t i) const {
        if (i < m_first) return m_rows[i];
        if (i < m_first + m_extraCount) return {m_extra[i - m_first], false};
        return m_rows[i - m_extraCount];
    }
    /// Position of a row once the extra rows are in.
    std::size_t positionOf(std::size_t row) const { return row < m_first ? row : row + m_extraCount; }

private:
    std::span<const MenuListRow> m_rows;
    std::size_t m_first;
    std::array<float, 2> m_extra{};
    std::size_t m_extraCount = 0;
    bool m_showsUp = false;
};

struct Fit {
    float y = 0;         ///< lower edge of what fits
    std::size_t end = 0; ///< the first row that does not fit
    std::optional<std::size_t> scrollDown;
};

Fit fitRows(const Arrangement& rows, const MenuListState& state) {
    Fit fit{state.height, rows.first(), {}};
    for (; fit.end < rows.size(); ++fit.end) {
        fit.y -= rows[fit.end].height;
        if (fit.y < 0) break;
    }
    if (fit.end == rows.size() || state.disallowScrolling) return fit;
    for (std::size_t j = fit.end; j >= 1; --j) {
        fit.y += rows[j].height;
        if (fit.y - state.scrollArrowHeight < 0) continue;
        fit.scrollDown = j;
        break;
    }
    return fit;
}

/// What each flexible row gets of the spare height.
float flexibleHeight(std::span<const MenuListRow> rows, const Arrangement& arrangement, const Fit& fit,
                     const MenuListState& state) {
    const auto count = std::ranges::count_if(rows, &MenuListRow::flexible);
    if (state.scrollIndex != 0 || fit.y <= 0 || count == 0) return 0;
    // The last row's height joins the spare height, not that of the flexible rows themselves.
    const float last = arrangement[arrangement.size() - 1].height;
    return std::floor((fit.y + last) / static_cast<float>(count));
}

float startOf(std::span<const MenuListRow> rows, const MenuListState& state) {
    float start = state.height;
    if (state.disallowScrolling) return start;
    for (std::size_t i = 0; i < state.scrollIndex; ++i)
        start += rows[i].height;
    return start;
}

bool isHidden(std::span<const MenuListRow> rows, const MenuListState& state, std::size_t target) {
    const Arrangement arrangement(rows, state);
    const Fit fit = fitRows(arrangement, state);
    return target < state.scrollIndex || arrangement.positionOf(target) >= fit.scrollDown.value_or(fit.end);
}

} // namespace

MenuListLayout layoutMenuList(std::span<const MenuListRow> rows, const MenuListState& state) {
    const Arrangement arrangement(rows, state);
    const Fit fit = fitRows(arrangement, state);
    MenuListLayout layout;
    std::size_t insertAt = state.scrollIndex;
    if (state.topSeparatorHeight) layout.topSeparator = insertAt++;
    if (arrangement.showsUp()) layout.scrollUp = insertAt;
    layout.scrollDown = fit.scrollDown;

    const std::size_t count = arrangement.size();
    layout.places.reserve(count + 1);
    if (count == 0) return layout;
    const float flexible = flexibleHeight(rows, arrangement, fit, state);
    float y = startOf(rows, state);
    const auto place = [&](float height) {
        layout.places.push_back({y, height, y < 0 || y + height > state.height});
    };
    for (std::size_t i = 0; i < count; ++i) {
        if (fit.scrollDown == i) {
            y = 0; // on the bottom edge, wherever the row before it ended
            place(state.scrollArrowHeight);
        }
        const MenuListRow row = arrangement[i];
        const float height = row.flexible ? flexible : row.height;
        y -= height;
        place(height);
    }
    return layout;
}

std::optional<std::size_t> scrollIndexUp(const MenuListState& state) {
    if (state.disallowScrolling || state.scrollIndex < 2) return {};
    // From 2 to 0, not 1: the arrow that goes away had taken a row itself.
    return state.scrollIndex > 2 ? state.scrollIndex - 1 : 0;
}

std::optional<std::size_t> scrollIndexDown(std::span<const MenuListRow> rows, const MenuListState& state) {
    const Arrangement arrangement(rows, state);
    // A list too low even for its arrows shows one at the end, too.
    if (state.scrollIndex >= rows.size() || !fitRows(arrangement, state).scrollDown) return {};
    return std::min(state.scrollIndex + (arrangement.showsUp() ? 1 : 2), rows.size());
}

std::size_t scrollIndexShowing(std::span<const MenuListRow> rows, MenuListState state, std::size_t target) {
    while (isHidden(rows, state, target)) {
        const auto next = scrollIndexUp(state);
        if (!next) break;
        state.scrollIndex = *next;
    }
    while (isHidden(rows, state, target)) {
        const auto next = scrollIndexDown(rows, state);
        if (!next) break;
        state.scrollIndex = *next;
    }
    return state.scrollIndex;
}
