#include "platform/linux/Backlog.h"

#include <gtest/gtest.h>

using platform::Backlog;

TEST(Backlog, admitsEachSenderUpToItsQuotaAndAllUpToTheWhole) {
    int calls = 0;
    Backlog backlog([&] { ++calls; });
    const auto [messages, bytes] = Backlog::ofSender;
    backlog.add(2, bytes - 1);
    EXPECT_TRUE(backlog.admits(2));
    backlog.add(2, Backlog::ofAll.bytes);
    EXPECT_FALSE(backlog.admits(2)) << "the last may be of any size";
    backlog.add(1, 0);
    EXPECT_FALSE(backlog.admits(1)) << "there is too much of all";
    EXPECT_TRUE(backlog.admits(3)) << "who has nothing waiting is let in even so";
    backlog.remove(2, Backlog::ofAll.bytes);
    EXPECT_EQ(calls, 1);
    EXPECT_TRUE(backlog.admits(1));
    EXPECT_TRUE(backlog.admits(2));

    // A sender with two connections: the one that is let in again must not make the other be forgotten.
    for (std::size_t i = 0; i < messages; ++i)
        backlog.add(4, 0);
    EXPECT_FALSE(backlog.admits(4));
    backlog.remove(4, 0);
    EXPECT_TRUE(backlog.admits(4));
    EXPECT_EQ(calls, 1) << "not before half is free";
    for (std::size_t i = 1; i < messages; ++i)
        backlog.remove(4, 0);
    EXPECT_EQ(calls, 2);
}
