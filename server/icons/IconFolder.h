#pragma once

#include "lib/plist/Value.h"

#include <string>

namespace tessel {

/// The icons in one folder: SVG files, drawn at every size of the menu. Any one thread.
class IconFolder {
public:
    explicit IconFolder(std::string path)
        : m_path(std::move(path)) {}

    /// The raw icon set of `<name>.svg`. Nil when there is no such file, and, logged, when the name has other
    /// characters than small letters, digits and '-', or the file is too large or no picture.
    plist::Value read(const std::string& name) const;

private:
    std::string m_path;
};

} // namespace tessel
