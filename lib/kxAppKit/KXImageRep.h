#pragma once

#include "lib/base/Geometry.h"

#include <memory>

class KXBitmapImageRep;
class QPainter;

enum class KXImageInterpolation { standard = 0, none = 1, low = 2, high = 3 };

/// One form of a picture: a bitmap, or anything that can draw itself. Not safe to use from two threads at
/// once.
class KXImageRep {
public:
    using Pointer = std::shared_ptr<KXImageRep>;

    explicit KXImageRep(KXSize size)
        : m_size(size) {}
    virtual ~KXImageRep() = default;
    KXImageRep(const KXImageRep&) = delete;
    KXImageRep& operator=(const KXImageRep&) = delete;
    KXImageRep(KXImageRep&&) = delete;
    KXImageRep& operator=(KXImageRep&&) = delete;

    KXSize size() const { return m_size; } ///< in points
    void setSize(KXSize size) { m_size = size; }
    virtual KXSize pixelSize() const { return m_size; }

    /// Draws the whole picture upright into `rect` (y down), with the painter's composition mode and opacity;
    /// the hint SmoothPixmapTransform asks for filtering.
    virtual void drawInRect(QPainter& painter, const KXRect& rect) const = 0;

    /// Draws the whole picture into `rect` of `target` (y up, 0 at the bottom row), replacing what was there.
    /// Pixels that `rect` does not touch keep their bytes. False when refused; the cause is in the log.
    bool drawIntoBitmapRep(KXBitmapImageRep& target, const KXRect& rect,
                           KXImageInterpolation interpolation) const;

private:
    KXSize m_size;
};
