#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

class SMMenuItem;

using SMMenuItems = std::vector<std::shared_ptr<SMMenuItem>>;

/// The menu's contents as the main application sent them last. A list that it did not send is null.
struct SMMenuModel {
    using List = std::shared_ptr<const SMMenuItems>;
    List topMenu;
    List bottomMenu;
    List pinnedApps;
    List frequentlyUsedApps;
    List searchableApps;
    std::shared_ptr<SMMenuItem> allProgramsMenu; ///< one folder over the whole tree; null when none was sent
    std::vector<std::string> nameList;           ///< of the virtual machines
    std::int32_t selectedIndex = 0;
};
