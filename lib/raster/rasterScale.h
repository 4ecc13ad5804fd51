#pragma once

#include "lib/raster/rasterops.h"

/// Scales the whole source onto a rectangle of the destination, in 16.16 fixed-point steps: nearest pixel,
/// two taps when an axis grows, box average of at most 32 pixels when it shrinks. The position of a
/// destination pixel counts from the destination's corner, so a part of a scaling shows what the whole would
/// show there.
///
/// Bits per pixel is the storage, a multiple of 8; depth is 16, 24 or 32. The formats are equal, except that
/// a source of 32 bits and depth 24 may be packed into a destination of depth 16 (5-6-5) or 24. `filter`
/// other than 0 asks for filtering, which needs a depth of 24 and more. Non-zero for success; a format that
/// is not supported is logged, once in a process. Memory beyond the two buffers: one block of at most 40
/// destination rows.
int Raster_Scale(void* destination, int destinationBytesPerRow, int destinationBitsPerPixel,
                 int destinationDepth, int destinationWidth, int destinationHeight, int reservedOne,
                 const RasterRect& destinationRect, const void* source, int sourceBytesPerRow,
                 int sourceBitsPerPixel, int sourceDepth, int reservedZero, int sourceWidth, int sourceHeight,
                 int reservedAlsoOne, double horizontalScale, double verticalScale, int filter);
