#pragma once

#include "lib/base/Geometry.h"

#include <functional>
#include <memory>
#include <string>

class QPainter;

namespace platform {

/// What a status item shows and where its clicks go. Implemented by the agent's status item view.
class StatusItemView {
public:
    virtual ~StatusItemView() = default;
    virtual KXSize frameSize() const = 0; ///< wanted; a host may grant another
    /// Paints the whole of (0, 0, size), y downwards.
    virtual void draw(QPainter& painter, KXSize size) = 0;
    virtual void mouseDown() = 0;
    virtual void rightMouseDown() = 0;
    virtual std::string toolTip() const = 0;
};

/// A place in the bar. Its end takes the item away.
class StatusItem {
public:
    virtual ~StatusItem() = default;
    virtual void setNeedsDisplay() = 0;
    /// Of the window that holds the view, in screen coordinates: y upwards from the bottom of the primary
    /// screen.
    virtual KXRect frame() const = 0;
};

/// The desktop's bar of status items, whichever of its forms the desktop has. Main thread only.
class StatusBar {
public:
    virtual ~StatusBar() = default;
    virtual float thickness() const = 0;
    /// The view is borrowed and must outlive the item.
    virtual std::unique_ptr<StatusItem> addItem(float length, StatusItemView& view) = 0;
};

} // namespace platform
