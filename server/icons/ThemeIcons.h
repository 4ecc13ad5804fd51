#pragma once

#include "lib/plist/Value.h"

#include <string>
#include <vector>

namespace tessel {

/// The icons of the desktop's theme. One thread, always the same; a QGuiApplication must exist.
class ThemeIcons {
public:
    struct Places {
        std::vector<std::string> themeFolders; ///< where themes are looked for, in order
        std::vector<std::string> looseFolders; ///< where icons without a theme are looked for
        std::string theme;
        std::string fallbackTheme;
    };

    /// Starts over: what was installed since is found from now on.
    void look(const Places& places);

    /// The raw icon set of a name of the theme, or of a file by its absolute path. Sizes that the icon does
    /// not have are made from larger ones, never from smaller ones. Nil when there is no such icon.
    plist::Value read(const std::string& name) const;
};

} // namespace tessel
