#include "lib/base/KXNotificationCenter.h"

#include <gtest/gtest.h>

TEST(NotificationCenter, FiltersInOrderOfRegistrationWhileObserversComeAndGo) {
    KXNotificationCenter center;
    std::string calls;
    const int list = 0, removed = 0, added = 0;
    const auto add = [&](const int& owner, const char* name, const void* object, char mark) {
        center.addObserver(&owner, name, object, [&calls, mark](const KXNotification&) { calls += mark; });
    };
    add(list, "update", nullptr, 'a');
    add(list, "update", &list, 'l');
    add(list, "close", nullptr, 'c');
    center.postNotification("update", &list);
    center.postNotification("update", &removed);
    EXPECT_EQ(calls, "ala");

    center.addObserver(&list, "close", nullptr, [&](const KXNotification& notification) {
        EXPECT_EQ(std::any_cast<const void*>(notification.object), &list);
        center.removeObserver(&removed);
        add(added, "close", nullptr, '+');
    });
    add(removed, "close", nullptr, '-');
    calls.clear();
    center.postNotification("close", &list);
    EXPECT_EQ(calls, "c");
    center.postNotification("close", &list);
    EXPECT_EQ(calls, "cc+");
}
