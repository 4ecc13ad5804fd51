#pragma once

#include "lib/base/SharedBytes.h"
#include "lib/kxAppKit/KXImageRep.h"

#include <QImage>
#include <memory>
#include <vector>

class KXBitmapImageRep;
namespace plist {
class Value;
}

enum class KXCompositingOperation { copy = 1, sourceOver = 2, sourceAtop = 5 };

/// A picture, and where its extent begins (y up).
struct KXExtentImage {
    QImage image;
    KXPoint origin;
};

/// A picture in several sizes. Copying shares the representations. Not safe to use from two threads at once.
/// Everything that makes a new image answers null when it cannot; the cause is in the log.
class KXImage {
public:
    using Pointer = std::shared_ptr<KXImage>;
    using BitmapPointer = std::shared_ptr<KXBitmapImageRep>;

    explicit KXImage(KXSize size = {})
        : m_size(size) {}

    /// Dictionaries of "format" ("bgra"), "width", "height" and "data": straight colours, lowest row first. A
    /// bad one is logged and left out.
    static Pointer imageWithRawIcons(const plist::Value& rawIcons);
    /// As large, in points, as the largest one has pixels. Null for none.
    static Pointer imageWithRepresentations(const std::vector<KXImageRep::Pointer>& reps);
    /// Of the extent's size. An origin other than zero moves the picture in it. Null for null.
    static Pointer imageWithCIImage(const KXExtentImage* image);
    static Pointer warningIcon();
    /// `image` drawn at `size`; a copy of it when that is zero; null when it is not valid.
    static Pointer initWithImage(const KXImage& image, KXSize size, KXImageInterpolation interpolation);

    KXSize size() const { return m_size; } ///< in points
    void setSize(KXSize size) { m_size = size; }
    /// Whether source rectangles count y from the top. The picture is drawn upright in either case.
    bool isFlipped() const { return m_flipped; }
    void setFlipped(bool flipped) { m_flipped = flipped; }
    bool isDataRetained() const { return m_dataRetained; }
    void setDataRetained(bool retained) { m_dataRetained = retained; }
    bool scalesWhenResized() const { return m_scalesWhenResized; }
    void setScalesWhenResized(bool scales) { m_scalesWhenResized = scales; }
    bool isValid() const { return !m_representations.empty(); }

    const std::vector<KXImageRep::Pointer>& representations() const { return m_representations; }
    void addRepresentation(KXImageRep::Pointer rep);

    /// The smallest with enough pixels for `size`, else the largest; null when none is usable. `isSmaller`
    /// may be null; it stays as it is when `size` is invalid.
    KXImageRep::Pointer bestImageRepForSize(KXSize size, bool* isSmaller = nullptr) const;
    /// By area in points: an equal one, else one that is larger by the least. A first one that is too small
    /// stays.
    KXImageRep::Pointer imageRepForSize(KXSize size) const;
    BitmapPointer bitmapImageRepForSize(KXSize size) const; ///< the same; null when it is no bitmap
    BitmapPointer bitmapImageRep() const;                   ///< the first bitmap, else a new one
    Pointer representationForSize(KXSize size) const;

    /// One bitmap of exactly `size` pixels, rounded up. Margins that keeping the aspect leaves are
    /// transparent.
    Pointer imageByScalingToSize(KXSize size, bool keepAspectRatio, KXImageInterpolation interpolation) const;
    KXRect scaledRectForFrame(const KXRect& frame) const; ///< whole points; y may grow either way
    /// `rect` counts y downwards.
    void maintainAspectRatioAndDrawInRect(QPainter& painter, const KXRect& rect) const;
    /// Its size is what keeping the aspect leaves of `size`.
    Pointer maintainAspectRatioAndScaleToSize(KXSize size) const;
    Pointer selectedImage() const; ///< the opaque parts darkened
    /// `type` is a four-character type code, without quotes.
    Pointer addBadgeWithType(const std::string& type) const;
    Pointer imageByApplyingOverlay(const KXImage& overlay) const;
    Pointer imageByBadgingOntoGenericDocumentIcon() const;
    /// Draws the document icon at each size of the icon family, on the first call only; the other method
    /// calls it.
    static void initializeDocumentIconTemplate();
    /// An icon family; empty when no size could be made.
    SharedBytes icnsData() const;
    SharedBytes TIFFRepresentation() const; ///< one picture for each representation

    /// Draws the part `fromRect` (in points of this image; the zero rectangle is all of it) into `rect`.
    void drawInRect(QPainter& painter, const KXRect& rect, const KXRect& fromRect,
                    KXCompositingOperation operation, float fraction) const;

    /// For rows: `side` x `side` pixels, premultiplied ARGB32, the picture centred with its aspect kept, from
    /// the best representation. The last one is kept, so asking again is free. A null image when there is no
    /// picture.
    QImage squareImage(int side) const;

private:
    KXSize m_size;
    bool m_flipped = false;
    bool m_dataRetained = false;
    bool m_scalesWhenResized = false;
    std::vector<KXImageRep::Pointer> m_representations;
    mutable QImage m_squareImage;
};
