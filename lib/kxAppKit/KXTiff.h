#pragma once

#include "lib/base/SharedBytes.h"
#include "lib/kxAppKit/KXBitmapImageRep.h"

#include <span>

/// Bitmaps as TIFF data in memory: alpha last, straight or premultiplied as the bitmap has it, with its ICC
/// bytes.
namespace KXTiff {

/// One picture after the other; empty when one cannot be written.
SharedBytes write(std::span<const KXBitmapImageRep* const> pictures);

/// Null for what is not a picture of 8 bits a sample.
KXBitmapImageRep::Pointer firstPicture(const SharedBytes& tiff);

} // namespace KXTiff
