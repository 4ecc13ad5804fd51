#include "lib/base/ExceptionLogging.h"

#include "lib/base/Log.h"

#include <array>
#include <cstdlib>
#include <exception>
#include <execinfo.h>
#include <memory>
#include <string>
#include <utility>

KXException::KXException(std::string name, std::string reason)
    : m_name(std::move(name))
    , m_reason(std::move(reason)) {
    std::array<void*, 64> frames{};
    const int count = backtrace(frames.data(), static_cast<int>(frames.size()));
    m_stack.assign(frames.begin(), frames.begin() + count);
}

KXException KXException::fromCurrent(const std::exception_ptr& thrown) {
    const auto foreign = [](const char* reason) {
        KXException exception("C++ exception", reason);
        exception.m_stack.clear();
        return exception;
    };
    try {
        if (thrown) std::rethrow_exception(thrown);
    } catch (const KXException& exception) {
        return exception;
    } catch (const std::exception& exception) {
        return foreign(exception.what());
    } catch (...) {
        return foreign("of unknown type");
    }
    return foreign("terminated without an exception");
}

std::string KXException::stackTrace() const {
    const std::unique_ptr<char*, decltype(&std::free)> symbols(
        backtrace_symbols(m_stack.data(), static_cast<int>(m_stack.size())), &std::free);
    std::string trace;
    for (std::size_t i = 0; symbols && i < m_stack.size(); ++i)
        trace += std::string(symbols.get()[i]) + "\n";
    return trace;
}

bool KXExceptionHandlerDelegate::shouldLogException(const KXException& exception, unsigned) {
    if (exception.name() == NSAccessibilityException) {
        Log("Warning: Objective-C accessibility exception thrown: %s\n", exception.what());
        return false;
    }
    Log("ERROR: Objective-C exception thrown: %s\n", exception.what());
    return true;
}

KXExceptionHandler& KXExceptionHandler::defaultExceptionHandler() {
    static KXExceptionHandler handler;
    return handler;
}

void KXExceptionHandler::log(const std::exception_ptr& thrown, Mask kind) const {
    if (!(m_mask & kind)) return;
    const KXException exception = KXException::fromCurrent(thrown);
    if (m_delegate && !m_delegate(exception, kind)) return;
    Log("*** %s: %s\n%s", exception.name().c_str(), exception.what(), exception.stackTrace().c_str());
}

void SetExceptionLogging(bool enabled) {
    auto& handler = KXExceptionHandler::defaultExceptionHandler();
    handler.setDelegate(enabled ? &KXExceptionHandlerDelegate::shouldLogException : nullptr);
    handler.setMask(enabled
                        ? KXExceptionHandler::logUncaughtException | KXExceptionHandler::logTopLevelException
                        : KXExceptionHandler::logAndHandleEverything);
    std::set_terminate([] {
        KXExceptionHandler::defaultExceptionHandler().handleUncaughtException(std::current_exception());
        std::abort();
    });
}
