/// benchMenu [--filter | --scripts | --scripts-warmed]: the menu's real window on the display it is started
/// on, timed from inside, from an event to a picture that the X server has taken. With --filter a compositing
/// manager seems to blur behind windows; it must not run then. With --scripts only what an opening in new
/// scripts takes. Prints "job<TAB>figure<TAB>unit" lines.

#include "app/SMMenuListWidget.h"
#include "app/SMMenuWindowForm.h"
#include "app/SMSearchField.h"
#include "app/menuBackground.h"
#include "app/menuFontWarmer.h"
#include "app/menuPainter.h"
#include "platform/UserDefaults.h"
#include "platform/linux/QtMainLoop.h"
#include "platform/linux/QtModifierKeys.h"
#include "platform/linux/QtWindowServer.h"
#include "platform/linux/SystemClock.h"
#include "platform/linux/XcbCapture.h"
#include "platform/linux/XcbConnection.h"

#include <QApplication>
#include <QKeyEvent>
#include <QWindow>
#include <algorithm>
#include <cstdio>
#include <cstring>
#include <malloc.h>
#include <string_view>

namespace {

std::size_t allocations = 0;

} // namespace

extern "C" {
void* __libc_malloc(std::size_t size);
/// Counts; operator new and the toolkit's own arrays come here too.
void* malloc(std::size_t size) {
    ++allocations;
    return __libc_malloc(size);
}
}

namespace {

using Clock = std::chrono::steady_clock;

struct Defaults final : platform::UserDefaults {
    int integerForKey(std::string_view) const override { return 0; }
};

struct Owner final : SMMenuWindowOwner {
    SMMenuModel contents;
    const SMMenuModel& model() const override { return contents; }
    void performMenuItemAction(const SMMenuItem&) override {}
    void showMenuSettings() override {}
    void selectIndex(std::int32_t) override {}
    void closeMenuWindow() override {}
    KXRect statusItemFrame() const override { return {1250, 778, 30, 22}; }
};

/// Pictures of the sizes that the daemon sends.
plist::Value rawIcons() {
    plist::Array icons;
    for (const int side : {16, 32, 48, 128}) {
        QImage icon(side, side, QImage::Format_ARGB32);
        icon.fill(QColor(40, 120, 200, 160));
        const auto size = static_cast<std::size_t>(icon.sizeInBytes());
        icons.push_back(plist::Dictionary{{"format", "bgra"},
                                          {"width", side},
                                          {"height", side},
                                          {"data", plist::Data::copyOf(icon.constBits(), size)}});
    }
    return icons;
}

SMMenuModel::List applications(int count) {
    const static plist::Value icons = rawIcons();
    constexpr const char* stems[] = {"Calculator", "Éditeur",  "Mail",   "Музыка",
                                     "Übersicht",  "Terminal", "Photos", "Notes"};
    auto items = std::make_shared<SMMenuItems>();
    for (int i = 0; i < count; ++i) {
        const std::string title = std::string(stems[i % 8]) + " " + std::to_string(i);
        items->push_back(
            SMMenuItem::initWithDictionary(plist::Dictionary{{"title", title}, {"rawIcons", icons}}));
    }
    return items;
}

double percentile(std::vector<double> values, double part) {
    std::ranges::sort(values);
    return values[static_cast<std::size_t>(part * static_cast<double>(values.size() - 1))];
}

void report(const std::string& job, double figure, const char* unit) {
    std::printf("%s\t%.3f\t%s\n", job.c_str(), figure, unit);
}

template <typename Work>
double milliseconds(Work work) {
    const auto start = Clock::now();
    work();
    return std::chrono::duration<double, std::milli>(Clock::now() - start).count();
}

void reportTimes(const std::string& job, const std::vector<double>& times) {
    report(job + ", median", percentile(times, 0.5), "ms");
    report(job + ", 99th percentile", percentile(times, 0.99), "ms");
}

class Bench final : QObject {
public:
    Bench() {
        m_owner.contents.topMenu = applications(8);
        m_owner.contents.nameList = {"Guest"};
        takeUpdate(300);
        warm(MenuPainter::prepareFonts);
        m_preparing = milliseconds([this] { m_maker.prepare(m_owner); });
        for (QWidget* widget : QApplication::topLevelWidgets())
            if (widget->objectName() == "menuWindow") m_view = widget;
        m_view->installEventFilter(this);
        m_field = m_view->findChild<SMSearchField*>("searchField");
        QCoreApplication::processEvents(); // as the agent, which waits for the first click by then
    }

    void lists() {
        for (const int count : {10, 1000, 10000}) {
            const SMMenuModel::List items = applications(count);
            std::vector<double> building;
            std::vector<double> showing;
            for (int round = 0; round < 51; ++round) {
                SMMenuCollectionView list({m_clock, m_loop, m_keys});
                list.setShowTopSeparator(true);
                list.setStyle(SMMenuButtonStyleList);
                list.setSize({300, 450});
                building.push_back(milliseconds([&] {
                    list.setMenuItems(*items);
                    list.performLayout();
                }));
                showing.push_back(milliseconds([&] { list.scrollItemToVisible(items->back().get()); }));
            }
            const std::string rows = std::to_string(count) + " rows, ";
            report(rows + "built and laid out", percentile(building, 0.5), "ms");
            report(rows + "the last brought into view", percentile(showing, 0.5), "ms");
        }
    }

    void opening() {
        std::vector<double> plain;
        std::vector<double> updated;
        const double first = milliseconds([this] { open(); });
        close();
        for (int round = 0; round < 200; ++round) {
            plain.push_back(milliseconds([this] { open(); }));
            close();
            updated.push_back(milliseconds([this] {
                takeUpdate(300);
                open();
            }));
            close();
        }
        report("window made ready while the agent starts", m_preparing, "ms");
        report("first click to painted panel", first, "ms");
        reportTimes("click to painted panel", plain);
        reportTimes("click to painted panel, with an update of 300 applications", updated);
    }

    void background() {
        std::vector<double> capturing;
        std::vector<double> blurring;
        for (int round = 0; round < 51; ++round) {
            QImage screen;
            capturing.push_back(milliseconds([&] { screen = platform::XcbCapture({800, 22, 480, 550}); }));
            blurring.push_back(milliseconds([&] { screen = menuBackground(screen); }));
        }
        report("of it the capture", percentile(capturing, 0.5), "ms");
        report("of it the blur", percentile(blurring, 0.5), "ms");
    }

    void typing() {
        m_owner.contents.searchableApps = applications(10000);
        open();
        std::vector<double> times;
        for (int round = 0; round < 30; ++round)
            for (const char* word : {"calcu", "mail 9", "музы", "edit", "e"}) {
                for (const QChar letter : QString::fromUtf8(word))
                    times.push_back(milliseconds([&] { press(0, QString(letter)); }));
                press(Qt::Key_Escape, {});
            }
        reportTimes("key press to painted results of 10,000 applications", times);
        close();
    }

    void repaint() {
        m_owner.contents.searchableApps = applications(10000);
        open();
        press(0, "a");
        auto* box = m_view->findChild<SMMenuListWidget*>("rightMenuBox");
        box->repaint();
        const auto allocationsOf = [box](const QRect& area) {
            box->repaint(area);
            const std::size_t before = allocations;
            box->repaint(area);
            return static_cast<double>(allocations - before);
        };
        const auto paintedRowsOf = [box](const QRect& area) {
            const std::size_t before = box->paintedRows();
            box->repaint(area);
            return static_cast<double>(box->paintedRows() - before);
        };
        // The highlighted row is in neither.
        const QRect some(0, box->height() / 2, box->width(), 40);
        const QRect more(0, box->height() / 2, box->width(), 160);
        const double rows = paintedRowsOf(more) - paintedRowsOf(some);
        report("allocations for each row in a repaint", (allocationsOf(more) - allocationsOf(some)) / rows,
               "");
        report("allocations in a repaint of all rows, the toolkit's own among them",
               allocationsOf(box->rect()), "");
        m_view->repaint();
        const std::size_t before = allocations;
        m_view->repaint();
        report("allocations in a repaint of the whole panel, the toolkit's own among them",
               static_cast<double>(allocations - before), "");
        report("rows painted in a repaint of 10,000", paintedRowsOf(box->rect()), "");
        const std::size_t made = box->tools().madeAnew();
        m_view->repaint();
        report("made anew in a repaint of the unchanged panel",
               static_cast<double>(box->tools().madeAnew() - made), "");
        std::vector<double> times;
        for (int round = 0; round < 51; ++round)
            times.push_back(milliseconds([this] { m_view->repaint(); }));
        report("repaint of the whole panel", percentile(times, 0.5), "ms");
        press(Qt::Key_Escape, {});
        close();
    }

    /// An update in scripts that this process has not shown yet, after their fonts were made ready or not.
    void newScripts(bool areWarmed) {
        takeUpdate(300);
        open();
        close();
        const std::vector<std::string> titles = {"한국어 입력기", "漢字變換", "नमस्ते", "โปรแกรม", "😀 Fun"};
        SMMenuItems items;
        for (const std::string& title : titles)
            items.push_back(SMMenuItem::initWithDictionary(plist::Dictionary{{"title", title}}));
        m_owner.contents.pinnedApps = std::make_shared<const SMMenuItems>(items);
        double longest = 0;
        if (areWarmed)
            warm([&longest](const std::string& text) {
                longest = std::max(longest, milliseconds([&] { MenuPainter::prepareFonts(text); }));
            });
        report(std::string("click to painted panel with five new scripts, ") +
                   (areWarmed ? "warmed" : "not warmed"),
               milliseconds([this] { open(); }), "ms");
        if (areWarmed) report("longest turn of the warming", longest, "ms");
        close();
    }

    void growth() {
        const auto openWithUpdates = [this](int count) {
            for (int round = 0; round < count; ++round) {
                takeUpdate(30);
                open();
                press(0, "e");
                press(Qt::Key_Escape, {});
                close();
            }
            return mallinfo2().uordblks;
        };
        const auto before = openWithUpdates(200);
        const auto after = openWithUpdates(1000);
        report("heap growth over 1,000 openings with updates",
               (static_cast<double>(after) - static_cast<double>(before)) / 1024, "KiB");
    }

private:
    /// As the agent does after an update.
    void warm(std::function<void(const std::string& text)> shape) {
        MenuFontWarmer warmer({m_loop, [] { return true; }, std::move(shape)});
        warmer.take(m_owner.contents);
        for (int turn = 0; turn < 50; ++turn)
            QCoreApplication::processEvents();
    }
    void takeUpdate(int count) {
        m_owner.contents.searchableApps = applications(count);
        m_owner.contents.pinnedApps = applications(5);
        m_owner.contents.frequentlyUsedApps = applications(10);
        if (m_window) m_window->reloadData();
    }
    bool eventFilter(QObject*, QEvent* event) override {
        if (event->type() == QEvent::Paint) m_isPainted = true;
        return false;
    }
    /// Until the panel was painted for what `event` led to, and the X server has the picture.
    template <typename Event>
    void untilPainted(Event event) {
        m_isPainted = false;
        event();
        while (!m_isPainted)
            QCoreApplication::processEvents(QEventLoop::WaitForMoreEvents);
        roundTrip();
    }
    static void roundTrip() {
        auto* c = platform::XcbConnection();
        std::free(xcb_get_input_focus_reply(c, xcb_get_input_focus(c), nullptr));
    }
    /// As the application controller does.
    void open() {
        untilPainted([this] {
            if (m_window)
                m_window->reloadData();
            else
                m_window = m_maker.make(m_owner);
            m_window->updateWindowHeight();
            m_window->setFrame({801, 778 - m_window->frame().height, 480, m_window->frame().height});
            m_window->showMenuWindow();
        });
    }
    void close() {
        m_window->hideMenuWindow();
        roundTrip();
        QCoreApplication::processEvents();
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete); // as a loop that runs does
    }
    void press(int key, const QString& text) {
        untilPainted([&] {
            QKeyEvent event(QEvent::KeyPress, key, Qt::NoModifier, text);
            QCoreApplication::sendEvent(m_field, &event);
        });
    }

    platform::SystemClock m_clock;
    platform::QtMainLoop m_loop;
    platform::QtModifierKeys m_keys;
    platform::QtWindowServer m_server;
    Defaults m_defaults;
    Owner m_owner;
    SMMenuWindowMaker m_maker{{m_server, m_clock, m_loop, m_keys, m_defaults}};
    std::unique_ptr<SMMenuWindow> m_window;
    double m_preparing = 0;
    QWidget* m_view = nullptr;
    bool m_isPainted = false;
    SMSearchField* m_field = nullptr;
};

} // namespace

int main(int argc, char** argv) {
    QApplication application(argc, argv);
    auto* c = platform::XcbConnection();
    if (!c) return 1;
    const bool filter = argc > 1 && std::string_view(argv[1]) == "--filter";
    const auto atom = platform::XcbAtom(c, "_KDE_NET_WM_BLUR_BEHIND_REGION");
    const auto root = platform::XcbRootWindow(c);
    if (filter) xcb_change_property(c, XCB_PROP_MODE_REPLACE, root, atom, XCB_ATOM_CARDINAL, 32, 0, nullptr);
    Bench bench;
    const std::string_view option = argc > 1 ? argv[1] : "";
    if (option.starts_with("--scripts")) {
        bench.newScripts(option == "--scripts-warmed");
        return 0;
    }
    bench.opening();
    if (filter) {
        xcb_delete_property(c, root, atom);
    } else {
        bench.background();
        bench.lists();
        bench.typing();
        bench.repaint();
        bench.growth();
    }
    return 0;
}
