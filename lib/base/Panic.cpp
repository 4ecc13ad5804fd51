#include "lib/base/Panic.h"

#include "lib/base/ExceptionLogging.h"
#include "lib/base/Log.h"

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <string>

void Panic(const char* format, ...) noexcept {
    std::va_list arguments;
    va_start(arguments, format);
    std::va_list measure;
    va_copy(measure, arguments);
    const int length = std::vsnprintf(nullptr, 0, format, measure);
    va_end(measure);
    std::string message(length > 0 ? static_cast<std::size_t>(length) : 0, '\0');
    std::vsnprintf(message.data(), message.size() + 1, format, arguments);
    va_end(arguments);
    Log("%s", message.c_str());

    SetExceptionLogging(false);
    auto& handler = KXExceptionHandler::defaultExceptionHandler();
    handler.setMask(KXExceptionHandler::logAndHandleEverything);
    try {
        throw KXException("Panic", "Backtrace");
    } catch (...) {
        handler.handleTopLevelException(std::current_exception());
    }
    std::abort();
}
