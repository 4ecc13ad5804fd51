#include "lib/kxAppKit/KXTiff.h"

#include "lib/base/Log.h"
#include "lib/base/SharedBytes.h"
#include "lib/kxAppKit/KXBitmapImageRep.h"
#include "lib/raster/rasterops.h"

#include <algorithm>
#include <cstdarg>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <memory>
#include <span>
#include <tiffio.h>
#include <utility>
#include <vector>

namespace KXTiff {

namespace {

/// A file in memory, as the library wants to see one. Reading looks at `input`, writing fills `output`.
struct Stream {
    std::span<const std::byte> input;
    std::vector<std::byte> output;
    std::size_t position = 0;

    std::span<const std::byte> bytes() const { return input.empty() ? std::span(output) : input; }
};

Stream& streamOf(thandle_t handle) {
    return *static_cast<Stream*>(handle);
}

tmsize_t readStream(thandle_t handle, void* to, tmsize_t size) {
    Stream& s = streamOf(handle);
    const auto all = s.bytes();
    const std::size_t count =
        std::min(static_cast<std::size_t>(size), all.size() - std::min(s.position, all.size()));
    if (count > 0) std::memcpy(to, all.data() + s.position, count);
    s.position += count;
    return static_cast<tmsize_t>(count);
}

tmsize_t writeStream(thandle_t handle, void* from, tmsize_t size) {
    Stream& s = streamOf(handle);
    const auto count = static_cast<std::size_t>(size);
    if (s.output.size() < s.position + count) s.output.resize(s.position + count);
    if (count > 0) std::memcpy(s.output.data() + s.position, from, count);
    s.position += count;
    return size;
}

toff_t seekStream(thandle_t handle, toff_t offset, int whence) {
    Stream& s = streamOf(handle);
    const std::size_t base = whence == SEEK_CUR ? s.position : whence == SEEK_END ? s.bytes().size() : 0;
    return s.position = base + offset;
}

toff_t sizeOfStream(thandle_t handle) {
    return streamOf(handle).bytes().size();
}

int closeStream(thandle_t) {
    return 0;
}

/// What the library has to say is left out: the caller logs the failure once.
int sayNothing(TIFF*, void*, const char*, const char*, va_list) {
    return 1;
}

struct Closed {
    void operator()(TIFF* tiff) const { TIFFClose(tiff); }
};
using File = std::unique_ptr<TIFF, Closed>;

File open(Stream& stream, const char* mode) {
    const std::unique_ptr<TIFFOpenOptions, decltype(&TIFFOpenOptionsFree)> options(TIFFOpenOptionsAlloc(),
                                                                                   TIFFOpenOptionsFree);
    TIFFOpenOptionsSetErrorHandlerExtR(options.get(), sayNothing, nullptr);
    TIFFOpenOptionsSetWarningHandlerExtR(options.get(), sayNothing, nullptr);
    return File(TIFFClientOpenExt("bitmap", mode, &stream, readStream, writeStream, seekStream, closeStream,
                                  sizeOfStream, nullptr, nullptr, options.get()));
}

void describe(TIFF* tiff, const KXBitmapImageRep& bitmap) {
    TIFFSetField(tiff, TIFFTAG_IMAGEWIDTH, bitmap.pixelsWide());
    TIFFSetField(tiff, TIFFTAG_IMAGELENGTH, bitmap.pixelsHigh());
    TIFFSetField(tiff, TIFFTAG_BITSPERSAMPLE, 8);
    TIFFSetField(tiff, TIFFTAG_SAMPLESPERPIXEL, bitmap.samplesPerPixel());
    TIFFSetField(tiff, TIFFTAG_PHOTOMETRIC, PHOTOMETRIC_RGB);
    TIFFSetField(tiff, TIFFTAG_PLANARCONFIG, PLANARCONFIG_CONTIG);
    TIFFSetField(tiff, TIFFTAG_COMPRESSION, COMPRESSION_NONE);
    TIFFSetField(tiff, TIFFTAG_ORIENTATION, ORIENTATION_TOPLEFT);
    TIFFSetField(tiff, TIFFTAG_ROWSPERSTRIP, TIFFDefaultStripSize(tiff, 0));
    if (bitmap.hasAlpha()) {
        const bool straight = bitmap.bitmapFormat() & KXAlphaNonpremultipliedBitmapFormat;
        const std::uint16_t alpha = straight ? EXTRASAMPLE_UNASSALPHA : EXTRASAMPLE_ASSOCALPHA;
        TIFFSetField(tiff, TIFFTAG_EXTRASAMPLES, 1, &alpha);
    }
    if (const SharedBytes& profile = bitmap.colorSyncProfileData(); !profile.empty())
        TIFFSetField(tiff, TIFFTAG_ICCPROFILE, static_cast<std::uint32_t>(profile.size()), profile.data());
}

bool writePicture(TIFF* tiff, const KXBitmapImageRep& bitmap) {
    describe(tiff, bitmap);
    const auto wide = static_cast<std::size_t>(bitmap.pixelsWide());
    const auto pixelBytes = bitmap.samplesPerPixel();
    std::vector<std::uint8_t> row(wide * static_cast<std::size_t>(pixelBytes));
    for (std::int32_t y = 0; y < bitmap.pixelsHigh(); ++y) {
        std::memcpy(row.data(), bitmap.bitmapData() + std::ptrdiff_t{y} * bitmap.bytesPerRow(), row.size());
        if (bitmap.bitmapFormat() & KXAlphaFirstBitmapFormat)
            Raster_Permute({row.data(), 0, wide, 1}, rasterARGBToRGBA);
        if (TIFFWriteScanline(tiff, row.data(), static_cast<std::uint32_t>(y), 0) < 0) return false;
    }
    return TIFFWriteDirectory(tiff) != 0;
}

std::uint16_t shortField(TIFF* tiff, std::uint32_t tag) {
    std::uint16_t value = 0;
    TIFFGetFieldDefaulted(tiff, tag, &value);
    return value;
}

bool hasPlainRows(TIFF* tiff) {
    const auto samples = shortField(tiff, TIFFTAG_SAMPLESPERPIXEL);
    return shortField(tiff, TIFFTAG_BITSPERSAMPLE) == 8 && (samples == 3 || samples == 4) &&
           shortField(tiff, TIFFTAG_PHOTOMETRIC) == PHOTOMETRIC_RGB &&
           shortField(tiff, TIFFTAG_PLANARCONFIG) == PLANARCONFIG_CONTIG &&
           shortField(tiff, TIFFTAG_ORIENTATION) == ORIENTATION_TOPLEFT && !TIFFIsTiled(tiff);
}

bool isStraight(TIFF* tiff) {
    std::uint16_t count = 0;
    const std::uint16_t* kinds = nullptr;
    TIFFGetFieldDefaulted(tiff, TIFFTAG_EXTRASAMPLES, &count, &kinds);
    return count > 0 && kinds[0] != EXTRASAMPLE_ASSOCALPHA;
}

KXBitmapImageRep::Pointer readPlainRows(TIFF* tiff, std::int32_t wide, std::int32_t high) {
    const bool alpha = shortField(tiff, TIFFTAG_SAMPLESPERPIXEL) == 4;
    const KXBitmapFormat format = isStraight(tiff) ? KXAlphaNonpremultipliedBitmapFormat : 0;
    const auto bitmap = alpha ? KXBitmapImageRep::imageRepWith32bitBuffer(nullptr, wide, high, format, 0)
                              : KXBitmapImageRep::imageRepWithPixels(wide, high, 24);
    if (!bitmap || TIFFScanlineSize(tiff) != bitmap->bytesPerRow()) return nullptr;
    for (std::int32_t y = 0; y < high; ++y) {
        std::uint8_t* const row = bitmap->bitmapData() + std::ptrdiff_t{y} * bitmap->bytesPerRow();
        if (TIFFReadScanline(tiff, row, static_cast<std::uint32_t>(y), 0) < 0) return nullptr;
    }
    return bitmap;
}

/// Palettes, greys, tiles and the like, as the library converts them: premultiplied R, G, B, A.
KXBitmapImageRep::Pointer readConverted(TIFF* tiff, std::int32_t wide, std::int32_t high) {
    const auto bitmap = KXBitmapImageRep::imageRepWith32bitBuffer(nullptr, wide, high, 0, 0);
    if (!bitmap) return nullptr;
    std::vector<std::uint32_t> words(static_cast<std::size_t>(wide) * static_cast<std::size_t>(high));
    if (!TIFFReadRGBAImageOriented(tiff, static_cast<std::uint32_t>(wide), static_cast<std::uint32_t>(high),
                                   words.data(), ORIENTATION_TOPLEFT, 1))
        return nullptr;
    std::memcpy(bitmap->bitmapData(), words.data(), words.size() * sizeof words[0]);
    return bitmap;
}

} // namespace

SharedBytes write(std::span<const KXBitmapImageRep* const> pictures) {
    Stream stream;
    File tiff = open(stream, "w");
    const bool written =
        tiff && std::all_of(pictures.begin(), pictures.end(), [&](const KXBitmapImageRep* picture) {
            return writePicture(tiff.get(), *picture);
        });
    tiff.reset();
    if (written) return SharedBytes::copyOf(stream.output.data(), stream.output.size());
    Log("%s: could not write TIFF data\n", "KXTiff");
    return {};
}

KXBitmapImageRep::Pointer firstPicture(const SharedBytes& data) {
    Stream stream{data.span(), {}};
    const File tiff = data.empty() ? nullptr : open(stream, "rm");
    std::uint32_t wide = 0;
    std::uint32_t high = 0;
    KXBitmapImageRep::Pointer bitmap;
    if (tiff && TIFFGetField(tiff.get(), TIFFTAG_IMAGEWIDTH, &wide) &&
        TIFFGetField(tiff.get(), TIFFTAG_IMAGELENGTH, &high) && std::in_range<std::int32_t>(wide) &&
        std::in_range<std::int32_t>(high)) {
        const auto read = hasPlainRows(tiff.get()) ? readPlainRows : readConverted;
        bitmap = read(tiff.get(), static_cast<std::int32_t>(wide), static_cast<std::int32_t>(high));
    }
    if (!bitmap) {
        Log("%s: could not read TIFF data of %zu bytes\n", "KXTiff", data.size());
        return nullptr;
    }
    std::uint32_t profileSize = 0;
    const void* profile = nullptr;
    if (TIFFGetField(tiff.get(), TIFFTAG_ICCPROFILE, &profileSize, &profile))
        bitmap->setColorSyncProfileData(SharedBytes::copyOf(profile, profileSize));
    return bitmap;
}

} // namespace KXTiff
