#pragma once

/// Logs the printf-style message, then a stack trace, and aborts; without memory to say it, aborts all the
/// same.
[[noreturn]] void Panic(const char* format, ...) noexcept __attribute__((format(printf, 1, 2)));
