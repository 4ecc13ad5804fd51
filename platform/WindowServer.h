#pragma once

#include "lib/base/Geometry.h"

#include <functional>
#include <memory>

class QImage;
class QWidget;

namespace platform {

/// What happens to a panel. Main thread.
class PanelDelegate {
public:
    /// The panel lost the keyboard, or a button was pressed outside of all windows of this process, and of
    /// those that came up above it unmanaged, as an input method's. One event may cause several calls, also
    /// after the panel was ordered out.
    virtual void panelDidResignKey() = 0;
    /// Option was pressed or let go while the panel had the keyboard, after the panel itself has handled it;
    /// also at every opening, as it then is.
    virtual void panelFlagsChanged(bool optionDown) = 0;

protected:
    ~PanelDelegate() = default;
};

/// A borderless window above all others, on every workspace, that takes the keyboard without activating
/// anything else. Frames are screen coordinates, y upwards. One that its screen's bars or edges leave no room
/// for is mirrored at the panel's own area, or shifted in; but `frame` answers what was set, so that sums
/// done with it stay true.
class PanelWindow {
public:
    virtual ~PanelWindow() = default;
    virtual KXRect frame() const = 0;
    virtual void setFrame(const KXRect& frame) = 0;
    virtual bool isVisible() const = 0;
    /// Remembers who had the keyboard.
    virtual void makeKeyAndOrderFront() = 0;
    /// Gives the keyboard back, unless somebody else has it by now.
    virtual void orderOut() = 0;

    /// Blurs whatever lies behind the panel from now on. Only where the server has a window filter.
    virtual void addWindowFilter() = 0;
    /// What the screen shows now where the panel will be, in device pixels; null where programs may not see
    /// it. For a panel that is hidden: it would see itself.
    virtual QImage screenBelow() const = 0;
};

/// The display's windows and screens. Main thread only.
class WindowServer {
public:
    virtual ~WindowServer() = default;

    /// What bars, docks and the status item itself leave free of the screen that the item is on, of the main
    /// one for an empty item; y upwards in both.
    virtual KXRect visibleFrame(const KXRect& item) const = 0;

    /// Whether the display can blur what lies behind a panel. Found out once per process.
    virtual bool hasWindowFilter() const = 0;

    /// Whether the user has asked the desktop to do without animations.
    virtual bool reducesMotion() const = 0;

    /// Makes the widget the content of a panel that is hidden at first. Widget and delegate are borrowed and
    /// must outlive the panel. `ownArea`, in screen coordinates, belongs to the panel though no window of
    /// this process need lie there: presses in it are not outside.
    virtual std::unique_ptr<PanelWindow> makePanel(QWidget& contentView, PanelDelegate& delegate,
                                                   std::function<KXRect()> ownArea) = 0;
};

} // namespace platform
