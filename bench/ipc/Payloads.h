#pragma once

#include "bench/ipc/Transport.h"

/// A message like those between daemon and agent, with contents that no codec can shorten.

/// "menu.update" of so many applications, each with an icon of each of these widths.
Payload MenuUpdate(int applications, const std::vector<int>& widths);
/// "menu.refresh", with `padding` bytes of text to make it longer.
Payload MenuRefresh(std::size_t padding = 0);

inline const std::vector<int> allWidths{16, 32, 48, 128};
inline const std::vector<int> listWidth{32};
