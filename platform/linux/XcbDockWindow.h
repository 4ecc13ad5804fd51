#pragma once

class QWidget;

/// What the toolkit cannot say to an X11 window manager about a window of a bar. Without X11 these do
/// nothing.
namespace platform {

/// To be called before the window is shown, with its flags set: they make the native window.
void MakeDockWindow(QWidget& window);

/// To be called after the window is shown: some window managers take the request from a mapped window alone.
void PutOnAllWorkspaces(QWidget& window);

} // namespace platform
