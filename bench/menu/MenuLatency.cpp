/// menuLatency ROUNDS LETTERS click X Y
/// menuLatency ROUNDS LETTERS run COMMAND…
/// A menu seen from outside: how long from a press at (X, Y), or from the start of a command, to a picture
/// that no longer changes, and from the press of a key to the same. Presses through XTEST, watches what the X
/// server draws through DAMAGE. Escape closes what was opened, untimed. Prints "job<TAB>median<TAB>90th
/// percentile" lines, in milliseconds.

#include <algorithm>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <optional>
#include <poll.h>
#include <spawn.h>
#include <string_view>
#include <sys/wait.h>
#include <vector>
#include <xcb/damage.h>
#include <xcb/xcb.h>
#include <xcb/xtest.h>

namespace {

using Clock = std::chrono::steady_clock;
using Milliseconds = std::chrono::duration<double, std::milli>;

/// A picture counts as settled when nothing was drawn for so long.
constexpr std::chrono::milliseconds quiet{250};
constexpr std::chrono::seconds patience{5}; ///< for something to be drawn at all
constexpr xcb_keysym_t escape = 0xFF1B;

template <typename T>
using Reply = std::unique_ptr<T, decltype(&std::free)>;

struct Drawing {
    Milliseconds first;
    Milliseconds last;
};

class Screen {
public:
    Screen()
        : m_connection(xcb_connect(nullptr, nullptr), &xcb_disconnect) {
        auto* c = m_connection.get();
        if (xcb_connection_has_error(c)) std::exit(1);
        const xcb_setup_t* setup = xcb_get_setup(c);
        m_root = xcb_setup_roots_iterator(setup).data->root;
        m_damageEvent = xcb_get_extension_data(c, &xcb_damage_id)->first_event;
        std::free(xcb_damage_query_version_reply(c, xcb_damage_query_version(c, 1, 1), nullptr));
        xcb_damage_create(c, xcb_generate_id(c), m_root, XCB_DAMAGE_REPORT_LEVEL_RAW_RECTANGLES);
        m_firstKey = setup->min_keycode;
        const auto keys = static_cast<std::uint8_t>(setup->max_keycode - m_firstKey + 1);
        m_keys.reset(
            xcb_get_keyboard_mapping_reply(c, xcb_get_keyboard_mapping(c, m_firstKey, keys), nullptr));
    }

    void move(int x, int y) {
        xcb_test_fake_input(m_connection.get(), XCB_MOTION_NOTIFY, 0, XCB_CURRENT_TIME, m_root,
                            static_cast<std::int16_t>(x), static_cast<std::int16_t>(y), 0);
        xcb_flush(m_connection.get());
    }
    void press() { fake(XCB_BUTTON_PRESS, XCB_BUTTON_RELEASE, 1); }
    void type(xcb_keysym_t key) {
        const xcb_keysym_t* symbols = xcb_get_keyboard_mapping_keysyms(m_keys.get());
        const int width = m_keys->keysyms_per_keycode;
        for (int i = 0; i < xcb_get_keyboard_mapping_keysyms_length(m_keys.get()); i += width)
            if (symbols[i] == key) {
                fake(XCB_KEY_PRESS, XCB_KEY_RELEASE, static_cast<std::uint8_t>(m_firstKey + i / width));
                return;
            }
    }

    /// Waits until the picture has settled.
    std::optional<Drawing> watch(Clock::time_point since) {
        std::optional<Drawing> drawing;
        while (const auto at = nextDrawing(drawing ? Clock::duration(quiet) : Clock::duration(patience))) {
            const Milliseconds passed = *at - since;
            drawing = drawing ? Drawing{drawing->first, passed} : Drawing{passed, passed};
        }
        return drawing;
    }
    /// What comes late from before is not to be taken for what comes next.
    void settle() {
        while (nextDrawing(quiet)) {
        }
    }

private:
    void fake(int down, int up, std::uint8_t what) {
        for (const int type : {down, up})
            xcb_test_fake_input(m_connection.get(), static_cast<std::uint8_t>(type), what, XCB_CURRENT_TIME,
                                m_root, 0, 0, 0);
        xcb_flush(m_connection.get());
    }
    std::optional<Clock::time_point> nextDrawing(Clock::duration wait) {
        const auto deadline = Clock::now() + wait;
        for (;;) {
            while (const Reply<xcb_generic_event_t> event{xcb_poll_for_event(m_connection.get()), &std::free})
                if ((event->response_type & 0x7f) == m_damageEvent + XCB_DAMAGE_NOTIFY) return Clock::now();
            const auto left = std::chrono::ceil<std::chrono::milliseconds>(deadline - Clock::now()).count();
            pollfd descriptor{xcb_get_file_descriptor(m_connection.get()), POLLIN, 0};
            if (left <= 0 || poll(&descriptor, 1, static_cast<int>(left)) == 0) return std::nullopt;
        }
    }

    std::unique_ptr<xcb_connection_t, decltype(&xcb_disconnect)> m_connection;
    xcb_window_t m_root = 0;
    int m_damageEvent = 0;
    std::uint8_t m_firstKey = 0;
    Reply<xcb_get_keyboard_mapping_reply_t> m_keys{nullptr, &std::free};
};

struct Job {
    const char* name;
    std::vector<double> first;
    std::vector<double> settled;

    void add(const std::optional<Drawing>& drawing) {
        if (!drawing) return;
        first.push_back(drawing->first.count());
        settled.push_back(drawing->last.count());
    }
    void print() {
        for (auto& [what, values] : {std::pair{"first drawing", &first}, std::pair{"settled", &settled}}) {
            if (values->empty()) continue;
            std::ranges::sort(*values);
            const auto at = [&](double part) {
                return (*values)[static_cast<std::size_t>(part * static_cast<double>(values->size() - 1))];
            };
            std::printf("%s, %s\t%.1f\t%.1f\n", name, what, at(0.5), at(0.9));
        }
    }
};

} // namespace

int main(int argc, char** argv) {
    if (argc < 5) return 2;
    const int rounds = std::atoi(argv[1]);
    const std::string_view letters = argv[2];
    const bool isCommand = std::string_view(argv[3]) == "run";
    Screen screen;
    if (!isCommand) screen.move(std::atoi(argv[4]), std::atoi(argv[5]));
    Job first{"first opening", {}, {}}; ///< of a process that goes on running
    Job opening{"opening", {}, {}};
    Job typing{"key", {}, {}};
    for (int round = 0; round < rounds; ++round) {
        pid_t process = 0;
        screen.settle();
        auto start = Clock::now();
        if (!isCommand)
            screen.press();
        else if (posix_spawnp(&process, argv[4], nullptr, nullptr, argv + 4, environ) != 0)
            return 1;
        (isCommand || round > 0 ? opening : first).add(screen.watch(start));
        for (const char letter : letters) {
            start = Clock::now();
            screen.type(static_cast<xcb_keysym_t>(letter));
            typing.add(screen.watch(start));
        }
        screen.type(escape);
        screen.settle();
        if (process) {
            kill(process, SIGTERM); // should it not have heard
            waitpid(process, nullptr, 0);
            continue;
        }
        screen.type(escape); // the first one left the search only
    }
    first.print();
    opening.print();
    typing.print();
}
