#pragma once

#include "app/SMEditingCommand.h"
#include "lib/base/Geometry.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

class SMMenuButton;
class SMMenuCollectionView; // NOLINT(*-virtual-class-destructor): it is final

/// The parts of the window whose place the window controller asks for.
enum class SMMenuArea : std::uint8_t {
    topPane,
    leftPane,
    rightPane,
    leftMenu,
    rightMenuBox,
    settingsButton,
    actionButton,
};

/// How a new list comes into the right pane.
enum SMMenuAnimation : std::int32_t {
    SMMenuAnimationBack = 0,    ///< slides in from the left
    SMMenuAnimationForward = 1, ///< slides in from the right
    SMMenuAnimationNone = 2,
};

/// What the window tells its controller. Points are window coordinates, y upwards.
class SMMenuWindowEvents {
public:
    virtual void viewWillDraw() = 0;
    virtual void mouseMoved(KXPoint point) = 0;
    virtual void mouseExited() = 0;
    virtual void mouseDown(KXPoint point) = 0;
    virtual void mouseUp(KXPoint point) = 0;
    /// `deltaY` counts wheel notches, positive upwards.
    virtual void scrollWheel(double deltaY, KXPoint point) = 0;
    virtual void controlTextDidChange() = 0;
    /// True when the command was dealt with, so that the field does nothing more.
    virtual bool doCommandBySelector(SMEditingCommand command) = 0;
    virtual void flagsChanged(bool optionDown) = 0;
    virtual void onVMListPopUpButton() = 0;
    virtual void onCloseShortcut() = 0;
    virtual void onSettingsShortcut() = 0;
    virtual void windowDidResignKey() = 0;

protected:
    ~SMMenuWindowEvents() = default;
};

/// The menu window and what lies in it, as the window controller works with them. Frames of the window are
/// screen coordinates, those of its parts window coordinates; y grows upwards in both. Main thread only.
class SMMenuWindowOutlets {
public:
    virtual ~SMMenuWindowOutlets() = default;

    /// Before anything else, and null before the receiver ends.
    virtual void setDelegate(SMMenuWindowEvents* delegate) = 0;

    virtual bool isVisible() const = 0;
    virtual KXRect frame() const = 0;
    /// Lays the parts out at once, and gives the lists that are shown their new size.
    virtual void setFrame(const KXRect& frame) = 0;
    /// Of the screen that the status item is on.
    virtual KXRect visibleScreenFrame() const = 0;
    /// With the keyboard in the search field.
    virtual void makeKeyAndOrderFront() = 0;
    virtual void orderOut() = 0;
    virtual void setNeedsDisplay() = 0;

    virtual KXRect areaFrame(SMMenuArea area) const = 0;
    /// Borrowed; replaced before they end.
    virtual void setButton(SMMenuArea area, SMMenuButton* button) = 0;
    virtual void setLeftList(SMMenuCollectionView* list) = 0;
    /// The list that was shown before is still there during the call.
    virtual void setRightList(SMMenuCollectionView* list, std::int32_t animation) = 0;

    virtual void setVMList(const std::vector<std::string>& names) = 0;
    /// An index out of range changes nothing.
    virtual void selectVM(std::int32_t index) = 0;
    virtual std::int32_t indexOfSelectedVM() const = 0;

    virtual std::string searchString() const = 0;
    /// Not told to the delegate.
    virtual void setSearchString(const std::string& text) = 0;
    /// For those who cannot see the list; none outside of a search.
    virtual void setResultCount(std::optional<std::size_t> count) = 0;
    /// The keyboard has moved the highlight there.
    virtual void didHighlightByKeyboard(const SMMenuButton& button) = 0;
};
