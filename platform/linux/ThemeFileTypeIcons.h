#pragma once

#include "platform/FileTypeIcons.h"

namespace platform {

/// Icons for types of files from the desktop's icon theme, by way of the type's MIME type. Where the desktop
/// names no theme, the one that GTK programs fall back to. Needs a GUI application.
class ThemeFileTypeIcons final : public FileTypeIcons {
public:
    ThemeFileTypeIcons();
    std::vector<IconPixels> iconForFileType(const std::string& type) override;
};

} // namespace platform
