#include "platform/linux/EwmhWorkspace.h"

#include "platform/Status.h"
#include "platform/Workspace.h"
#include "platform/linux/EwmhDisplay.h"
#include "platform/linux/WindowChoice.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <vector>
#include <xcb/xproto.h>

namespace platform {

namespace {

using Numbers = EwmhDisplay::Numbers;

bool Holds(const Numbers& numbers, std::uint32_t number) {
    return std::ranges::find(numbers, number) != numbers.end();
}

std::vector<WindowFacts> FactsOf(const EwmhDisplay& display, std::span<const xcb_window_t> windows) {
    const auto shown = display.numbersOfRoot(EwmhDisplay::currentDesktop);
    const auto desktops = display.numbers(windows, EwmhDisplay::windowDesktop);
    const auto states = display.numbers(windows, EwmhDisplay::windowState);
    const auto types = display.numbers(windows, EwmhDisplay::windowType);
    constexpr std::uint32_t everyDesktop = 0xFFFFFFFF;
    std::vector<WindowFacts> facts;
    for (std::size_t i = 0; i < windows.size(); ++i)
        facts.push_back({windows[i], Holds(states[i], display.atom(EwmhDisplay::stateHidden)),
                         !shown.empty() && !desktops[i].empty() && desktops[i].front() != everyDesktop &&
                             desktops[i].front() != shown.front(),
                         Holds(types[i], display.atom(EwmhDisplay::typeDesktop)) ||
                             Holds(types[i], display.atom(EwmhDisplay::typeDock))});
    return facts;
}

std::vector<xcb_window_t> WindowsOf(const EwmhDisplay& display, std::uint32_t pid) {
    const auto all = display.numbersOfRoot(EwmhDisplay::clientListStacking);
    const auto processes = display.processes(all);
    std::vector<xcb_window_t> windows;
    for (std::size_t i = 0; i < all.size(); ++i)
        if (processes[i] == pid) windows.push_back(all[i]);
    return windows;
}

} // namespace

int EwmhWorkspace::frontProcessID() const {
    const EwmhDisplay display;
    if (!display) return 0;
    const auto active = display.numbersOfRoot(EwmhDisplay::activeWindow);
    return active.empty() ? 0 : static_cast<int>(display.processes({active.data(), 1}).front());
}

Status EwmhWorkspace::bringToFront(int pid, ProcessWindows which) const {
    const EwmhDisplay display;
    if (!display) return status::noWindowServer;
    const auto windows =
        WindowsToRaise(FactsOf(display, WindowsOf(display, static_cast<std::uint32_t>(pid))));
    if (windows.empty()) return status::processHasNoWindow;
    if (which == ProcessWindows::all) display.raise(windows);
    display.request(windows.back(), EwmhDisplay::activeWindow, XCB_WINDOW_NONE);
    display.finish();
    return status::success;
}

Status EwmhWorkspace::currentDesktop(unsigned& number) const {
    const EwmhDisplay display;
    if (!display) return status::noWindowServer;
    const auto desktop = display.numbersOfRoot(EwmhDisplay::currentDesktop);
    if (desktop.empty()) return status::unsupported;
    number = desktop.front();
    return status::success;
}

std::optional<DesktopGrid> EwmhWorkspace::desktopGrid() const {
    const EwmhDisplay display;
    if (!display) return {};
    const auto count = display.numbersOfRoot(EwmhDisplay::numberOfDesktops);
    if (count.empty()) return {};
    return GridOfDesktops(display.numbersOfRoot(EwmhDisplay::desktopLayout), count.front());
}

} // namespace platform
