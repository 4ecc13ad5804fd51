#include "server/linux/SpawnedPrograms.h"

#include "lib/base/Log.h"

#include <cerrno>
#include <cstring>
#include <optional>
#include <spawn.h>
#include <stdlib.h>
#include <string>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

namespace tessel {

std::optional<int> SpawnedPrograms::start(const std::string& path) {
    std::string argument = path;
    char* arguments[] = {argument.data(), nullptr};
    pid_t pid = 0;
    const int error = posix_spawn(&pid, path.c_str(), nullptr, nullptr, arguments, environ);
    if (error == 0) return pid;
    Log("Could not start \"%s\": %s\n", path.c_str(), std::strerror(error));
    return std::nullopt;
}

std::optional<std::string> SpawnedPrograms::reap(int pid) {
    int status = 0;
    pid_t reaped = 0;
    do
        reaped = waitpid(pid, &status, 0);
    while (reaped < 0 && errno == EINTR);
    if (reaped != pid) return std::strerror(errno);
    if (WIFSIGNALED(status)) return std::string("signal ") + std::to_string(WTERMSIG(status));
    if (WEXITSTATUS(status) == 0) return std::nullopt;
    return "exit code " + std::to_string(WEXITSTATUS(status));
}

} // namespace tessel
