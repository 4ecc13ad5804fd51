#include "platform/linux/PollMainLoop.h"
#include "platform/linux/QtMainLoop.h"
#include "platform/linux/SystemClock.h"

#include <QCoreApplication>
#include <gmock/gmock.h>
#include <optional>
#include <sys/eventfd.h>
#include <thread>

// The contract of main loops, held by both of them.

using namespace std::chrono_literals;
using testing::ElementsAre;

namespace {

struct PollWorld {
    bool runUntil(const std::function<bool()>& condition) { return loop->runUntil(condition, 20s); }

    platform::SystemClock clock;
    std::optional<platform::PollMainLoop> loop{std::in_place, clock};
};

struct QtWorld {
    bool runUntil(const std::function<bool()>& condition) const {
        while (!condition())
            QCoreApplication::processEvents(QEventLoop::WaitForMoreEvents);
        return true;
    }

    int count = 1;
    char name[5] = "test";
    char* arguments[2] = {name, nullptr};
    QCoreApplication application{count, arguments};
    std::optional<platform::QtMainLoop> loop{std::in_place};
};

template <typename World>
struct MainLoopContract : testing::Test {
    World m_world;
};
using Worlds = testing::Types<PollWorld, QtWorld>;
TYPED_TEST_SUITE(MainLoopContract, Worlds);

} // namespace

TYPED_TEST(MainLoopContract, runsWhatAnyThreadPostsLaterInOrderAndStarvesNothing) {
    auto& world = this->m_world;
    auto& loop = *world.loop;
    std::vector<int> called;
    loop.post([&] {
        loop.post([&] { called.push_back(3); });
        called.push_back(1);
        EXPECT_TRUE(world.runUntil([&] { return called.size() == 3; })) << "turned from inside";
    });
    std::thread([&] { loop.post([&] { called.push_back(2); }); }).join();
    EXPECT_TRUE(called.empty());
    const std::function<void()> again = [&] { loop.post(again); };
    again();
    bool timed = false;
    const auto timer = loop.startTimer(1ms, 0ms, [&] { timed = true; });
    EXPECT_TRUE(world.runUntil([&] { return timed; }));
    EXPECT_THAT(called, ElementsAre(1, 2, 3));

    std::thread other([&] {
        for (int i = 0; i < 1000; ++i)
            loop.post([&] { called.push_back(i); });
    });
    EXPECT_TRUE(world.runUntil([&] { return called.size() == 1003; })) << "woken by another thread";
    other.join();
}

TYPED_TEST(MainLoopContract, callsUntilTheHandleEndsEvenFromInsideOrAfterIt) {
    auto& world = this->m_world;
    auto& loop = *world.loop;
    std::vector<int> called;
    const platform::Descriptor first(eventfd(1, EFD_NONBLOCK)), second(eventfd(1, EFD_NONBLOCK));
    std::unique_ptr<platform::Handle> once, repeated, cancelled, watches[2];
    once = loop.startTimer(0ms, 0ms, [&] { called.push_back(1); });
    cancelled = loop.startTimer(0ms, 0ms, [] { ADD_FAILURE(); });
    cancelled.reset();
    repeated = loop.startTimer(1ms, 2ms, [&] {
        called.push_back(2);
        if (called.size() == 3) repeated.reset();
    });
    EXPECT_TRUE(world.runUntil([&] { return called.size() == 3 && !repeated; }));
    // Whichever is called first ends both at its second call, though the other is readable too.
    int calls = 0;
    for (auto& watch : watches) {
        watch = loop.watchReadable(&watch == watches ? first.get() : second.get(), [&] {
            if (++calls < 3) return;
            for (auto& each : watches)
                each.reset();
        });
    }
    once = loop.startTimer(20ms, 0ms, [&] { called.push_back(3); });
    EXPECT_TRUE(world.runUntil([&] { return called.size() == 4; }));
    EXPECT_EQ(calls, 3);
    EXPECT_THAT(called, ElementsAre(1, 2, 2, 3));

    once = loop.startTimer(0ms, 0ms, [] { ADD_FAILURE(); });
    loop.post([] { ADD_FAILURE(); });
    world.loop.reset();
}

TEST(PollMainLoop, runsUntilAnotherThreadQuits) {
    platform::SystemClock clock;
    platform::PollMainLoop loop(clock);
    std::thread other([&] { loop.quit(); });
    loop.run();
    other.join();
    EXPECT_FALSE(loop.runUntil([] { return false; }, 1ms));
}
