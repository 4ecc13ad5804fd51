#include "platform/linux/XcbServerTime.h"

#include "platform/linux/XcbCalls.h"
#include "platform/linux/XcbConnection.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>
#include <xcb/sync.h>
#include <xcb/xcb.h>
#include <xcb/xproto.h>

namespace platform {

namespace {

/// The counter that is the clock; 0 where there is none.
xcb_sync_counter_t clockAmong(const xcb_sync_list_system_counters_reply_t& counters) {
    // By hand: to the library names begin two bytes too late, and so does each counter but the first.
    constexpr std::size_t lengthAt = 12, nameAt = 14, alignment = 4;
    const auto* at = reinterpret_cast<const char*>(&counters + 1);
    for (auto left = counters.counters_len; left > 0; --left) {
        xcb_sync_counter_t counter = 0;
        std::uint16_t length = 0;
        std::memcpy(&counter, at, sizeof counter);
        std::memcpy(&length, at + lengthAt, sizeof length);
        if (std::string_view(at + nameAt, length) == "SERVERTIME") return counter;
        at += (nameAt + length + alignment - 1) / alignment * alignment;
    }
    return 0;
}

xcb_sync_counter_t findClock(xcb_connection_t* c) {
    const auto* extension = xcb_get_extension_data(c, &xcb_sync_id);
    if (!extension || !extension->present) return 0;
    const auto asked = xcb_sync_initialize(c, XCB_SYNC_MAJOR_VERSION, XCB_SYNC_MINOR_VERSION);
    const XcbReply<xcb_sync_initialize_reply_t> version(xcb_sync_initialize_reply(c, asked, nullptr));
    const XcbReply<xcb_sync_list_system_counters_reply_t> counters(
        xcb_sync_list_system_counters_reply(c, xcb_sync_list_system_counters(c), nullptr));
    return version && counters ? clockAmong(*counters) : 0;
}

} // namespace

std::uint32_t XcbServerTime() {
    auto* c = XcbConnection();
    if (!c) return XCB_CURRENT_TIME;
    static const auto clock = findClock(c);
    if (clock == 0) return XCB_CURRENT_TIME;
    const XcbReply<xcb_sync_query_counter_reply_t> time(
        xcb_sync_query_counter_reply(c, xcb_sync_query_counter(c, clock), nullptr));
    return time ? time->counter_value.lo : std::uint32_t{XCB_CURRENT_TIME};
}

void XcbAnnounceServerTime() {
    auto* c = XcbConnection();
    if (!c) return;
    // To a property that nobody reads; nothing is added to it.
    xcb_change_property(c, XCB_PROP_MODE_APPEND, XcbRootWindow(c), XcbAtom(c, "_TESSEL_TIME"),
                        XCB_ATOM_CARDINAL, 32, 0, nullptr);
    xcb_flush(c);
}

} // namespace platform
