#include "platform/linux/PrivateDirectory.h"

#include "lib/base/Log.h"
#include "platform/linux/Descriptor.h"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <string>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

namespace platform {

namespace {

constexpr auto directoryName = "com.corvane.kxipc";

// The path of a socket has 107 bytes at most, 25 of which may be its directory's; a temporary name takes one
// more.
constexpr std::size_t maximalNameLength = 80;

bool IsOurs(const struct stat& status) {
    return S_ISDIR(status.st_mode) && status.st_uid == geteuid();
}

bool IsOursAlone(const struct stat& status) {
    return IsOurs(status) && (status.st_mode & (S_IRWXU | S_IRWXG | S_IRWXO)) == S_IRWXU;
}

} // namespace

std::string DefaultPortDirectory() {
    const char* runtime = std::getenv("XDG_RUNTIME_DIR");
    if (runtime && *runtime == '/') return std::string(runtime) + '/' + directoryName;
    const auto user = std::to_string(geteuid());
    const auto usual = "/run/user/" + user;
    struct stat status = {};
    if (lstat(usual.c_str(), &status) == 0 && IsOurs(status)) return usual + '/' + directoryName;
    return std::string("/tmp/") + directoryName + '-' + user;
}

Descriptor OpenPrivateDirectory(int at, const std::string& path) {
    if (mkdirat(at, path.c_str(), S_IRWXU) != 0 && errno != EEXIST) {
        Log("IPC: %s: unable to make %s: %s\n", "OpenPrivateDirectory", path.c_str(), std::strerror(errno));
        return {};
    }
    Descriptor directory(openat(at, path.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    struct stat status = {};
    if (!directory || fstat(directory.get(), &status) != 0 || !IsOursAlone(status)) {
        Log("IPC: %s: %s is not a directory of this user alone, refusing to use it\n", "OpenPrivateDirectory",
            path.c_str());
        return {};
    }
    flock(directory.get(), LOCK_SH | LOCK_NB); // whoever cleans /tmp may leave it alone for that
    return directory;
}

std::string PrivateDirectoryFault(const std::string& path) {
    struct stat status = {};
    if (lstat(path.c_str(), &status) != 0) {
        const auto above = path.substr(0, path.rfind('/') + 1);
        return errno != ENOENT || access(above.c_str(), W_OK) != 0 ? std::strerror(errno) : "";
    }
    if (!S_ISDIR(status.st_mode)) return "is no directory";
    if (!IsOurs(status)) return "belongs to user " + std::to_string(status.st_uid);
    return IsOursAlone(status) ? "" : "is open to others, or closed to you";
}

bool IsPortName(const std::string& name) {
    return !name.empty() && name.size() <= maximalNameLength && name.front() != '.' &&
           name.find('/') == name.npos && name.find('\0') == name.npos && !name.ends_with(".lock") &&
           name != "notices";
}

std::string PathInDirectory(int directory, const std::string& name) {
    return "/proc/self/fd/" + std::to_string(directory) + '/' + name;
}

} // namespace platform
