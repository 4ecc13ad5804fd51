/// clickLatency X Y [ROUNDS]: seen from outside, how long from a press at (X, Y) to a picture that no longer
/// changes. Presses through XTEST, watches what the X server draws through DAMAGE, and prints the medians of
/// the first and of the last drawing, in milliseconds. A second press closes what the first opened, untimed.

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <optional>
#include <poll.h>
#include <vector>
#include <xcb/damage.h>
#include <xcb/xcb.h>
#include <xcb/xtest.h>

namespace {

using Clock = std::chrono::steady_clock;
using Milliseconds = std::chrono::duration<double, std::milli>;

/// A picture counts as settled when nothing was drawn for so long.
constexpr std::chrono::milliseconds quiet{250};

struct Drawing {
    Milliseconds first;
    Milliseconds last;
};

class Screen {
public:
    Screen()
        : m_connection(xcb_connect(nullptr, nullptr), &xcb_disconnect) {
        if (xcb_connection_has_error(m_connection.get())) std::exit(1);
        m_root = xcb_setup_roots_iterator(xcb_get_setup(m_connection.get())).data->root;
        m_damageEvent = xcb_get_extension_data(m_connection.get(), &xcb_damage_id)->first_event;
        std::free(xcb_damage_query_version_reply(
            m_connection.get(), xcb_damage_query_version(m_connection.get(), 1, 1), nullptr));
        xcb_damage_create(m_connection.get(), xcb_generate_id(m_connection.get()), m_root,
                          XCB_DAMAGE_REPORT_LEVEL_RAW_RECTANGLES);
        xcb_flush(m_connection.get());
    }

    void move(int x, int y) {
        xcb_test_fake_input(m_connection.get(), XCB_MOTION_NOTIFY, 0, XCB_CURRENT_TIME, m_root,
                            static_cast<std::int16_t>(x), static_cast<std::int16_t>(y), 0);
        xcb_flush(m_connection.get());
    }

    /// Presses and releases the left button, and waits until the picture has settled.
    std::optional<Drawing> press() {
        for (const int type : {XCB_BUTTON_PRESS, XCB_BUTTON_RELEASE})
            xcb_test_fake_input(m_connection.get(), static_cast<std::uint8_t>(type), 1, XCB_CURRENT_TIME,
                                m_root, 0, 0, 0);
        const auto start = Clock::now();
        xcb_flush(m_connection.get());
        std::optional<Drawing> drawing;
        while (const auto at = nextDrawing()) {
            const Milliseconds since = *at - start;
            drawing = drawing ? Drawing{drawing->first, since} : Drawing{since, since};
        }
        return drawing;
    }

private:
    std::optional<Clock::time_point> nextDrawing() {
        const auto deadline = Clock::now() + quiet;
        for (;;) {
            while (const std::unique_ptr<xcb_generic_event_t, decltype(&std::free)> event{
                xcb_poll_for_event(m_connection.get()), &std::free})
                if ((event->response_type & 0x7f) == m_damageEvent + XCB_DAMAGE_NOTIFY) return Clock::now();
            const auto left = std::chrono::ceil<std::chrono::milliseconds>(deadline - Clock::now()).count();
            pollfd descriptor{xcb_get_file_descriptor(m_connection.get()), POLLIN, 0};
            if (left <= 0 || poll(&descriptor, 1, static_cast<int>(left)) == 0) return std::nullopt;
        }
    }

    std::unique_ptr<xcb_connection_t, decltype(&xcb_disconnect)> m_connection;
    xcb_window_t m_root = 0;
    int m_damageEvent = 0;
};

double median(std::vector<double> values) {
    std::nth_element(values.begin(), values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2),
                     values.end());
    return values[values.size() / 2];
}

} // namespace

int main(int argc, char** argv) {
    if (argc < 3) return 2;
    const int rounds = argc > 3 ? std::atoi(argv[3]) : 20;
    Screen screen;
    screen.move(std::atoi(argv[1]), std::atoi(argv[2]));
    std::vector<double> first;
    std::vector<double> last;
    for (int round = 0; round < rounds; ++round) {
        if (const auto drawing = screen.press()) {
            first.push_back(drawing->first.count());
            last.push_back(drawing->last.count());
        }
        screen.press();
    }
    if (first.empty()) return 1;
    std::printf("first drawing %.1f ms, settled %.1f ms (medians of %zu)\n", median(first), median(last),
                first.size());
}
