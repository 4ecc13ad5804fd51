#pragma once

#include "platform/StatusBar.h"

#include <vector>

namespace platform {

/// A status bar of our own for desktops that have none: a small dock window per item at the top right of the
/// primary screen, above other windows and on every workspace. It takes no room from them. Each item added
/// stands to the left of the ones before.
class StripStatusBar final : public StatusBar {
public:
    float thickness() const override { return 22; }
    std::unique_ptr<StatusItem> addItem(float length, StatusItemView& view) override;

private:
    class Item;

    std::vector<Item*> m_items; ///< from the right
};

} // namespace platform
