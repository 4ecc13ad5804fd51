#pragma once

#include "platform/MainLoop.h"

#include <cstdint>
#include <memory>
#include <optional>

/// What a panel needs of the X server beyond the toolkit. Everything does nothing without one.
namespace platform {

/// Whether a compositing manager runs.
bool XcbIsCompositing();

/// Whether the compositing manager says that it blurs what lies behind windows.
bool XcbAnnouncesBlurBehind();
/// Asks it to, behind the whole window.
void XcbBlurBehind(std::uint32_t window);
/// Whether this is Wayland's X server: a picture of the screen would be black, and the keyboard's focus is
/// the compositor's.
bool XcbIsUnderWayland();

/// The window that the window manager counts as active; 0 for none.
std::uint32_t XcbActiveWindow();
/// The window that has the keyboard; 0 for none, 1 for the one under the pointer.
std::uint32_t XcbInputFocus();
/// Whether any visible window of this process has the keyboard.
bool XcbHasInputFocus();
/// Whether the first window is the second, or lies somewhere in it.
bool XcbIsWithin(std::uint32_t window, std::uint32_t outer);
/// Whether the pointer is on a window that came up above the given one without the window manager, as menus
/// and an input method's candidates do.
bool XcbIsPointerAbove(std::uint32_t window);
/// Gives the window the keyboard, if it can be seen, and if nobody was given it after that time of the
/// server's.
void XcbSetInputFocus(std::uint32_t window, std::uint32_t time);
/// From now on the server holds keys back from a press of the left or the right button on the window until
/// that button is let go, or `XcbLetTypingGo`: also while this process has not yet seen the press. A process
/// that hangs does so for no longer than the user's finger.
void XcbHoldTypingFromPress(std::uint32_t window);
void XcbLetTypingGo();
/// Until the handle ends no key event reaches any program; then those that wait go to the window that has the
/// keyboard. For moments only. Null where that cannot be had.
std::unique_ptr<Handle> XcbHoldTyping();
/// All keys go to the window until the handle ends, whoever has the focus. The window must be seen.
std::unique_ptr<Handle> XcbGrabKeyboard(std::uint32_t window);

/// Asks for presses of buttons anywhere on the screen, whoever gets them.
void XcbWatchButtonPresses();
/// The button, if the native event is such a press.
std::optional<unsigned> XcbPressedButton(const void* nativeEvent);

} // namespace platform
