#include "lib/base/ExceptionLogging.h"
#include "tests/support/ScratchHome.h"

#include <csignal>
#include <gmock/gmock.h>
#include <stdexcept>
#include <thread>

using testing::AllOf;
using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;

namespace {

std::string logOf(const auto& exception) {
    const ScratchHome home;
    KXExceptionHandler::defaultExceptionHandler().handleTopLevelException(std::make_exception_ptr(exception));
    return ScratchHome::log();
}

TEST(ExceptionLogging, AsksTheDelegateWhileItIsOn) {
    SetExceptionLogging(true);
    const KXException accessibility(NSAccessibilityException, "stale element");
    EXPECT_THAT(logOf(accessibility),
                AllOf(EndsWith(": Warning: Objective-C accessibility exception thrown: stale element\n"),
                      Not(HasSubstr("***"))));
    EXPECT_THAT(logOf(KXException("Odd", "went wrong")),
                AllOf(HasSubstr(": ERROR: Objective-C exception thrown: went wrong\n"),
                      HasSubstr(": *** Odd: went wrong\n"), HasSubstr("testBase")))
        << "with a frame of this program";
    EXPECT_THAT(logOf(7), HasSubstr(": ERROR: Objective-C exception thrown: of unknown type\n"));
    SetExceptionLogging(false);
    EXPECT_THAT(logOf(accessibility), AllOf(HasSubstr(": *** NSAccessibilityException: stale element\n"),
                                            Not(HasSubstr("Warning"))));
}

TEST(ExceptionLogging, WhatEndsTheProcessIsLoggedFirst) {
    const ScratchHome home;
    SetExceptionLogging(true);
    const auto throwUncaught = [] {
        std::thread([] { throw std::runtime_error("nobody caught me"); }).join();
    };
    EXPECT_EXIT(throwUncaught(), testing::KilledBySignal(SIGABRT), "");
    EXPECT_THAT(ScratchHome::log(), HasSubstr(": ERROR: Objective-C exception thrown: nobody caught me\n"));
}

} // namespace
