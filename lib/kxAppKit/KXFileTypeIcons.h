#pragma once

#include "lib/kxAppKit/KXImage.h"

#include <string>

namespace platform {
class FileTypeIcons;
}

/// The desktop's icons for types of files, as images. Main thread only.
namespace KXFileTypeIcons {

/// Set once by `main`, before the first icon; borrowed. Without one there are no icons.
void setSource(platform::FileTypeIcons* source);

/// `type` is a file extension or a quoted type code ("'docu'"). Null when the desktop has none.
KXImage::Pointer iconForFileType(const std::string& type);

/// "docu" as "'docu'".
std::string fileTypeForHFSTypeCode(const std::string& code);

} // namespace KXFileTypeIcons
