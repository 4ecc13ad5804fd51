#include "lib/base/Log.h"

#include <array>
#include <cerrno>
#include <chrono>
#include <cstdarg>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <fcntl.h>
#include <filesystem>
#include <string>
#include <system_error>
#include <unistd.h>
#include <utility>

namespace fs = std::filesystem;

namespace {

std::string& baseName() {
    static std::string name = "corvane-tesselStartMenu";
    return name;
}

/// "Nov  5 14:03:22.120: ", in local time. English whatever the locale, so that logs can be searched.
std::string timestamp() {
    static constexpr std::array months = {"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                          "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};
    const auto now = std::chrono::system_clock::now();
    const auto milliseconds =
        std::chrono::duration_cast<std::chrono::milliseconds>(now.time_since_epoch()).count() % 1000;
    const std::time_t seconds = std::chrono::system_clock::to_time_t(now);
    std::tm local{};
    localtime_r(&seconds, &local);
    std::array<char, 48> text{};
    std::snprintf(text.data(), text.size(),
                  "%s %2d %02d:%02d:%02d.%03d: ", months.at(static_cast<std::size_t>(local.tm_mon)),
                  local.tm_mday, local.tm_hour, local.tm_min, local.tm_sec, static_cast<int>(milliseconds));
    return text.data();
}

void appendFormatted(std::string& entry, const char* format, std::va_list arguments) {
    std::va_list again;
    va_copy(again, arguments);
    const int length = std::vsnprintf(nullptr, 0, format, again);
    va_end(again);
    if (length <= 0) return;
    const auto start = entry.size();
    entry.resize(start + static_cast<std::size_t>(length) + 1);
    std::vsnprintf(entry.data() + start, static_cast<std::size_t>(length) + 1, format, arguments);
    entry.pop_back();
}

void writeEntry(const char* format, std::va_list arguments) {
    std::string entry = timestamp();
    appendFormatted(entry, format, arguments);

    const fs::path path = LogFilePath(0);
    std::error_code ignored;
    fs::create_directories(path.parent_path(), ignored);
    const int file = open(path.c_str(), O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC, 0644);
    if (file < 0) return;
    while (write(file, entry.data(), entry.size()) < 0 && errno == EINTR) {
    }
    close(file);
}

} // namespace

void Log(const char* format, ...) {
    std::va_list arguments;
    va_start(arguments, format);
    writeEntry(format, arguments);
    va_end(arguments);
}

void Warning(const char* format, ...) {
    std::va_list arguments;
    va_start(arguments, format);
    writeEntry(format, arguments);
    va_end(arguments);
}

void SetLogBaseName(std::string name) {
    baseName() = std::move(name);
}

std::string LogFilePath(int index) {
    const char* home = std::getenv("HOME");
    const fs::path directory = fs::path(home ? home : "") / "Library" / "Logs" / "Corvane Tessel";
    // Index 1 has suffix 0: looks like an off-by-one, and is how the files are named.
    const std::string suffix = index > 0 ? "-" + std::to_string(index - 1) : "";
    return directory / (baseName() + suffix + ".log");
}

void RotateLogFiles() {
    std::error_code ignored;
    fs::remove(LogFilePath(3), ignored);
    for (int index = 2; index >= 0; --index)
        fs::rename(LogFilePath(index), LogFilePath(index + 1), ignored);
}

void RotateLargeLogFile() {
    constexpr std::uintmax_t large = 1 << 20;
    std::error_code error;
    const auto size = fs::file_size(LogFilePath(0), error);
    if (!error && size >= large) RotateLogFiles();
}
