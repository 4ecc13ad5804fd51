#include "app/SMApplication.h"
#include "lib/base/ExceptionLogging.h"
#include "tests/support/ScratchHome.h"

#include <QEvent>
#include <gmock/gmock.h>

namespace {

struct Thrower final : QObject {
    bool event(QEvent*) override { throw KXException("Oops", "no such row"); }
};

TEST(Application, LogsAnExceptionThatReachesTheEventLoopAndGoesOn) {
    int count = 1;
    char name[] = "test";
    char* arguments[] = {name, nullptr};
    const SMApplication application(count, arguments);
    const ScratchHome home;
    SetExceptionLogging(true);
    Thrower thrower;
    QEvent event(QEvent::User);
    EXPECT_FALSE(QCoreApplication::sendEvent(&thrower, &event));
    EXPECT_THAT(ScratchHome::log(), testing::HasSubstr("ERROR: Objective-C exception thrown: "));

    LogToolkitMessages();
    qWarning("a message of the toolkit");
    qInstallMessageHandler(nullptr);
    EXPECT_THAT(ScratchHome::log(), testing::HasSubstr(": default: a message of the toolkit\n"));
}

} // namespace
