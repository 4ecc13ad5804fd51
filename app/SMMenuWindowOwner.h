#pragma once

#include "app/SMMenuModel.h"
#include "lib/base/Geometry.h"

/// The application controller as the menu window sees it.
class SMMenuWindowOwner {
public:
    virtual ~SMMenuWindowOwner() = default;
    virtual const SMMenuModel& model() const = 0;
    virtual void performMenuItemAction(const SMMenuItem& item) = 0;
    virtual void showMenuSettings() = 0;
    virtual void selectIndex(std::int32_t index) = 0;
    virtual void closeMenuWindow() = 0;
    /// In screen coordinates, y upwards; a press in it is the item's own and not one outside the menu. Empty
    /// while there is no item.
    virtual KXRect statusItemFrame() const = 0;
};
