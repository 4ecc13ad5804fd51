#include "platform/linux/TerminationSignals.h"
#include "tests/support/ManualMainLoop.h"

#include <csignal>
#include <gtest/gtest.h>

namespace {

TEST(TerminationSignals, BecomeCallsFromTheMainLoop) {
    ManualMainLoop loop;
    int calls = 0;
    for (const int number : {SIGTERM, SIGINT, SIGHUP}) {
        const platform::TerminationSignals signals(loop, [&] { ++calls; });
        const int before = calls;
        std::raise(number);
        EXPECT_EQ(calls, before) << "not from the signal handler";
        EXPECT_TRUE(loop.runUntil([&] { return calls == before + 1; }));
    }
    EXPECT_EXIT(std::raise(SIGTERM), testing::KilledBySignal(SIGTERM), "") << "afterwards as before";
}

} // namespace
