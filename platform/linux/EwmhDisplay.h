#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <vector>
#include <xcb/xcb.h>

namespace platform {

/// A connection to $DISPLAY, and its window manager's properties. Questions about several windows cost one
/// round trip together.
class EwmhDisplay {
public:
    enum Name : std::size_t {
        activeWindow,
        clientListStacking,
        currentDesktop,
        numberOfDesktops,
        desktopLayout,
        supported,
        restackWindow,
        windowProcess,
        windowDesktop,
        windowState,
        stateHidden,
        windowType,
        typeDesktop,
        typeDock,
        nameCount
    };

    EwmhDisplay();
    explicit operator bool() const { return m_root != XCB_WINDOW_NONE; }

    xcb_window_t root() const { return m_root; }
    std::uint32_t atom(Name name) const { return m_atoms[name]; }

    /// A property of 32-bit numbers of each window; empty when it has none.
    using Numbers = std::vector<std::uint32_t>;
    std::vector<Numbers> numbers(std::span<const xcb_window_t> windows, Name property) const;
    Numbers numbersOfRoot(Name property) const;

    /// The ids of the processes that the windows belong to: as the X server knows them, which a window in a
    /// sandbox does not; else as the windows say; else 0.
    Numbers processes(std::span<const xcb_window_t> windows) const;

    /// Asks the window manager, as a pager does, for something about `window`.
    void request(xcb_window_t window, Name message, std::uint32_t detail) const;
    /// Has the windows raised one after the other.
    void raise(std::span<const xcb_window_t> windows) const;
    /// Waits until the server has taken what was asked for. It forgets the rest when we disconnect.
    void finish() const;

private:
    struct Disconnect {
        void operator()(xcb_connection_t* connection) const { xcb_disconnect(connection); }
    };

    Numbers processesByConnection(std::span<const xcb_window_t> windows) const;

    std::unique_ptr<xcb_connection_t, Disconnect> m_connection;
    xcb_window_t m_root = XCB_WINDOW_NONE;
    Numbers m_atoms;
};

} // namespace platform
