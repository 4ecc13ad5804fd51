#pragma once

#include "lib/base/SharedBytes.h"

#include <string>
#include <vector>

namespace platform {

/// One size of an icon: premultiplied RGBA bytes, top row first, rows of width x 4 bytes.
struct IconPixels {
    int width = 0;
    int height = 0;
    SharedBytes rgba;
};

/// The desktop's icons for types of files.
class FileTypeIcons {
public:
    virtual ~FileTypeIcons() = default;
    /// `type` is a file extension, or a four-character type code in single quotes ("'docu'"). Every size that
    /// the icon theme has; empty when it has none.
    virtual std::vector<IconPixels> iconForFileType(const std::string& type) = 0;
};

} // namespace platform
