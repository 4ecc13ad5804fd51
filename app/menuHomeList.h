#pragma once

#include "app/SMMenuModel.h"

/// How many rows the menu has room for, and which applications its home list shows. Pure.

inline constexpr float menuPaneMargin = 10;
inline constexpr float menuRowHeight = 40;

/// Of the whole window, for the usable height of the screen.
float menuWindowHeight(float windowHeight, float rightBoxHeight, float visibleHeight);

/// Pinned applications in the order given, a separator, frequently used ones by title. The separator does not
/// count against what fits into `rightBoxHeight`.
SMMenuItems pinnedAndFrequentlyUsedApps(const SMMenuModel& model, float rightBoxHeight);
