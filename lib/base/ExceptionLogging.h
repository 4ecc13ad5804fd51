#pragma once

#include <exception>
#include <string>
#include <vector>

/// An exception with a name and a reason, and the stack of where it was made.
class KXException : public std::exception {
public:
    KXException(std::string name, std::string reason);
    /// Whatever was thrown: itself, or one named "C++ exception" with its text and no stack.
    static KXException fromCurrent(const std::exception_ptr& thrown);

    const std::string& name() const { return m_name; }
    const char* what() const noexcept override { return m_reason.c_str(); }
    std::string stackTrace() const; ///< a line a frame; empty when unknown

private:
    std::string m_name;
    std::string m_reason;
    std::vector<void*> m_stack;
};

inline constexpr const char* NSAccessibilityException = "NSAccessibilityException";

/// Decides what the process's exception handler logs while the program's own exception logging is on.
struct KXExceptionHandlerDelegate {
    /// Logs the exception; whether the handler shall log it further, with its stack.
    static bool shouldLogException(const KXException& exception, unsigned mask);
};

/// What happens to exceptions that nobody caught: those that reach the program's event loop, and those that
/// end the process.
class KXExceptionHandler {
public:
    enum Mask : unsigned {
        logUncaughtException = 1,
        logTopLevelException = 64,
        logAndHandleEverything = 1023,
    };
    using Delegate = bool (*)(const KXException&, unsigned mask);

    static KXExceptionHandler& defaultExceptionHandler();
    void setDelegate(Delegate delegate) { m_delegate = delegate; }
    void setMask(unsigned mask) { m_mask = mask; }

    void handleTopLevelException(const std::exception_ptr& thrown) const {
        log(thrown, logTopLevelException);
    }
    void handleUncaughtException(const std::exception_ptr& thrown) const {
        log(thrown, logUncaughtException);
    }

private:
    void log(const std::exception_ptr& thrown, Mask kind) const;

    Delegate m_delegate = nullptr;
    unsigned m_mask = 0;
};

/// On: the program's own logging of uncaught and top-level exceptions. Off: everything with its stack.
/// Either way what ends the process is logged first. Main thread only.
void SetExceptionLogging(bool enabled);
