#include "platform/linux/DetachedProgram.h"

#include "platform/Status.h"
#include "platform/linux/ExecLine.h"
#include "platform/linux/GObjectPointer.h"

#include <algorithm>
#include <array>
#include <csignal>
#include <cstddef>
#include <glib.h>
#include <signal.h>
#include <string>
#include <string_view>
#include <unistd.h>
#include <vector>

namespace platform {

namespace {

constexpr std::string_view launchedEntry = "GIO_LAUNCHED_DESKTOP_FILE=";
constexpr std::string_view launchedProcess = "GIO_LAUNCHED_DESKTOP_FILE_PID=";
constexpr std::size_t longestNumber = 20;

/// What a program was told of its own start is no news for those that it starts.
constexpr std::array ownStart = {launchedEntry, launchedProcess, std::string_view("KX_LAUNCH_PROPERTIES="),
                                 std::string_view("DESKTOP_STARTUP_ID="),
                                 std::string_view("XDG_ACTIVATION_TOKEN=")};

std::vector<std::string> EnvironmentWith(const std::vector<std::string>& variables) {
    std::vector<std::string> environment;
    for (char** variable = environ; *variable != nullptr; ++variable) {
        const std::string_view text(*variable);
        if (std::ranges::none_of(ownStart, [&](const auto name) { return text.starts_with(name); }))
            environment.emplace_back(text);
    }
    environment.insert(environment.end(), variables.begin(), variables.end());
    return environment;
}

std::vector<char*> Pointers(std::vector<std::string>& strings) {
    std::vector<char*> pointers;
    for (auto& string : strings)
        pointers.push_back(string.data());
    pointers.push_back(nullptr);
    return pointers;
}

/// In the new process, before it executes the program: nothing may be allocated there.
void SetUpChild(gpointer digits) {
    sigset_t none;
    sigemptyset(&none);
    sigprocmask(SIG_SETMASK, &none, nullptr);
    if (digits == nullptr) return;
    std::array<char, longestNumber> reversed{};
    std::size_t count = 0;
    for (auto pid = getpid(); pid > 0; pid /= 10)
        reversed[count++] = static_cast<char>('0' + pid % 10);
    auto* out = static_cast<char*>(digits);
    while (count > 0)
        *out++ = reversed[--count];
    *out = '\0';
}

} // namespace

DetachedStart StartDetached(const Command& command, const std::string& directory,
                            const std::vector<std::string>& variables) {
    auto words = command;
    auto environment = EnvironmentWith(variables);
    char* digits = nullptr;
    if (std::ranges::any_of(variables, [](const auto& text) { return text.starts_with(launchedEntry); })) {
        auto& last = environment.emplace_back(launchedProcess);
        last.resize(launchedProcess.size() + longestNumber);
        digits = last.data() + launchedProcess.size();
    }
    GPid pid = 0;
    GError* error = nullptr;
    if (g_spawn_async(directory.empty() ? nullptr : directory.c_str(), Pointers(words).data(),
                      Pointers(environment).data(), G_SPAWN_SEARCH_PATH, SetUpChild, digits, &pid, &error))
        return {status::success, {}, pid};
    const GErrorPointer owned(error);
    const bool isMissing = g_error_matches(error, G_SPAWN_ERROR, G_SPAWN_ERROR_NOENT);
    return {isMissing ? status::fileNotFound : status::launchFailed, error->message, 0};
}

} // namespace platform
