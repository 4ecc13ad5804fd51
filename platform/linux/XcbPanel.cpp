#include "platform/linux/XcbPanel.h"

#include "platform/MainLoop.h"
#include "platform/linux/XcbCalls.h"
#include "platform/linux/XcbConnection.h"

#include <QGuiApplication>
#include <QScreen>
#include <QWindow>
#include <algorithm>
#include <cstdint>
#include <memory>
#include <optional>
#include <xcb/xcb.h>
#include <xcb/xinput.h>
#include <xcb/xproto.h>

namespace platform {

namespace {

constexpr const char* blurBehind = "_KDE_NET_WM_BLUR_BEHIND_REGION";

class KeyboardGrab final : public Handle {
public:
    /// Refused while somebody else has it, as a window manager during its shortcuts: then we go without.
    KeyboardGrab(xcb_window_t window, xcb_grab_mode_t mode) {
        const auto cookie = xcb_grab_keyboard(m_connection, 0, window, XCB_CURRENT_TIME, XCB_GRAB_MODE_ASYNC,
                                              static_cast<std::uint8_t>(mode));
        const XcbReply<xcb_grab_keyboard_reply_t> reply(
            xcb_grab_keyboard_reply(m_connection, cookie, nullptr));
    }
    ~KeyboardGrab() override {
        xcb_ungrab_keyboard(m_connection, XCB_CURRENT_TIME);
        xcb_flush(m_connection);
    }
    KeyboardGrab(const KeyboardGrab&) = delete;
    KeyboardGrab& operator=(const KeyboardGrab&) = delete;

private:
    xcb_connection_t* m_connection = XcbConnection();
};

} // namespace

bool XcbIsCompositing() {
    auto* c = XcbConnection();
    return c && XcbSelectionOwner(c, "_NET_WM_CM_S0") != XCB_WINDOW_NONE;
}

bool XcbAnnouncesBlurBehind() {
    auto* c = XcbConnection();
    if (!c) return false;
    const auto atom = XcbAtom(c, blurBehind);
    const XcbReply<xcb_list_properties_reply_t> reply(
        xcb_list_properties_reply(c, xcb_list_properties(c, XcbRootWindow(c)), nullptr));
    if (!reply) return false;
    const xcb_atom_t* atoms = xcb_list_properties_atoms(reply.get());
    const xcb_atom_t* end = atoms + xcb_list_properties_atoms_length(reply.get());
    return std::find(atoms, end, atom) != end;
}

void XcbBlurBehind(std::uint32_t window) {
    auto* c = XcbConnection();
    if (!c) return;
    // A region without a rectangle stands for the whole window, whatever its size becomes.
    xcb_change_property(c, XCB_PROP_MODE_REPLACE, window, XcbAtom(c, blurBehind), XCB_ATOM_CARDINAL, 32, 0,
                        nullptr);
    xcb_flush(c);
}

bool XcbIsUnderWayland() {
    auto* c = XcbConnection();
    if (!c) return true;
    constexpr char extension[] = "XWAYLAND";
    const XcbReply<xcb_query_extension_reply_t> reply(
        xcb_query_extension_reply(c, xcb_query_extension(c, sizeof extension - 1, extension), nullptr));
    if (reply && reply->present) return true;
    // Older ones lack the extension, but name their outputs so.
    const QScreen* screen = QGuiApplication::primaryScreen();
    return screen && screen->name().startsWith(QLatin1String(extension));
}

std::uint32_t XcbActiveWindow() {
    return XcbWindowNamedByRoot("_NET_ACTIVE_WINDOW");
}

std::uint32_t XcbInputFocus() {
    auto* c = XcbConnection();
    if (!c) return 0;
    const XcbReply<xcb_get_input_focus_reply_t> reply(
        xcb_get_input_focus_reply(c, xcb_get_input_focus(c), nullptr));
    return reply ? reply->focus : 0;
}

bool XcbHasInputFocus() {
    const auto windows = QGuiApplication::topLevelWindows();
    return std::any_of(windows.begin(), windows.end(), [focus = XcbInputFocus()](const QWindow* window) {
        return window->isVisible() && focus == window->winId();
    });
}

bool XcbIsWithin(std::uint32_t window, std::uint32_t outer) {
    auto* c = XcbConnection();
    while (c && window > XCB_INPUT_FOCUS_POINTER_ROOT && window != outer) {
        const XcbReply<xcb_query_tree_reply_t> tree(
            xcb_query_tree_reply(c, xcb_query_tree(c, window), nullptr));
        window = tree ? tree->parent : xcb_window_t{XCB_WINDOW_NONE};
    }
    return window == outer && window != XCB_WINDOW_NONE;
}

bool XcbIsPointerAbove(std::uint32_t window) {
    auto* c = XcbConnection();
    if (!c) return false;
    const auto pointerCookie = xcb_query_pointer(c, XcbRootWindow(c));
    const auto treeCookie = xcb_query_tree(c, XcbRootWindow(c));
    const XcbReply<xcb_query_pointer_reply_t> pointer(xcb_query_pointer_reply(c, pointerCookie, nullptr));
    const XcbReply<xcb_query_tree_reply_t> tree(xcb_query_tree_reply(c, treeCookie, nullptr));
    if (!pointer || !tree) return false;
    const xcb_window_t* first = xcb_query_tree_children(tree.get());
    const xcb_window_t* end = first + tree->children_len;
    const auto* below = std::find(first, end, window);
    if (std::find(below, end, pointer->child) == end) return false;
    // The window manager's frames are not managed either; they are of its connection.
    const auto connection = ~xcb_get_setup(c)->resource_id_mask;
    const auto manager = XcbWindowNamedByRoot("_NET_SUPPORTING_WM_CHECK");
    const XcbReply<xcb_get_window_attributes_reply_t> attributes(
        xcb_get_window_attributes_reply(c, xcb_get_window_attributes(c, pointer->child), nullptr));
    return attributes && attributes->override_redirect &&
           (pointer->child & connection) != (manager & connection);
}

void XcbSetInputFocus(std::uint32_t window, std::uint32_t time) {
    auto* c = XcbConnection();
    if (!c) return;
    // Checked, though nothing can be done: the toolkit would report that the window has gone meanwhile.
    const auto cookie = xcb_set_input_focus_checked(c, XCB_INPUT_FOCUS_PARENT, window, time);
    const XcbReply<xcb_generic_error_t> error(xcb_request_check(c, cookie));
}

void XcbHoldTypingFromPress(std::uint32_t window) {
    auto* c = XcbConnection();
    if (!c) return;
    constexpr std::uint16_t events =
        XCB_EVENT_MASK_BUTTON_PRESS | XCB_EVENT_MASK_BUTTON_RELEASE | XCB_EVENT_MASK_BUTTON_MOTION;
    for (const auto button : {XCB_BUTTON_INDEX_1, XCB_BUTTON_INDEX_3}) {
        // Checked, though nothing can be done where another has grabbed them.
        const auto cookie = xcb_grab_button_checked(c, 1, window, events, XCB_GRAB_MODE_ASYNC,
                                                    XCB_GRAB_MODE_SYNC, XCB_WINDOW_NONE, XCB_CURSOR_NONE,
                                                    static_cast<std::uint8_t>(button), XCB_MOD_MASK_ANY);
        const XcbReply<xcb_generic_error_t> error(xcb_request_check(c, cookie));
    }
}

void XcbLetTypingGo() {
    auto* c = XcbConnection();
    if (!c) return;
    xcb_allow_events(c, XCB_ALLOW_ASYNC_KEYBOARD, XCB_CURRENT_TIME);
    xcb_flush(c);
}

std::unique_ptr<Handle> XcbHoldTyping() {
    auto* c = XcbConnection();
    // Wayland's X server would hold nothing back of what is typed elsewhere.
    if (!c || XcbIsUnderWayland()) return nullptr;
    return std::make_unique<KeyboardGrab>(XcbRootWindow(c), XCB_GRAB_MODE_SYNC);
}

std::unique_ptr<Handle> XcbGrabKeyboard(std::uint32_t window) {
    if (!XcbConnection()) return nullptr;
    return std::make_unique<KeyboardGrab>(window, XCB_GRAB_MODE_ASYNC);
}

void XcbWatchButtonPresses() {
    auto* c = XcbConnection();
    if (!c) return;
    struct {
        xcb_input_event_mask_t head;
        std::uint32_t mask;
    } selection{{XCB_INPUT_DEVICE_ALL_MASTER, 1}, XCB_INPUT_XI_EVENT_MASK_RAW_BUTTON_PRESS};
    xcb_input_xi_select_events(c, XcbRootWindow(c), 1, &selection.head);
    xcb_flush(c);
}

std::optional<unsigned> XcbPressedButton(const void* nativeEvent) {
    const auto* event = static_cast<const xcb_ge_generic_event_t*>(nativeEvent);
    if ((event->response_type & 0x7F) != XCB_GE_GENERIC || event->event_type != XCB_INPUT_RAW_BUTTON_PRESS)
        return {};
    const auto* extension = xcb_get_extension_data(XcbConnection(), &xcb_input_id);
    if (!extension || event->extension != extension->major_opcode) return {};
    return static_cast<const xcb_input_raw_button_press_event_t*>(nativeEvent)->detail;
}

} // namespace platform
