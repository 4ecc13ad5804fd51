#include "platform/linux/SmallFile.h"

#include "platform/linux/Descriptor.h"

#include <cstddef>
#include <fcntl.h>
#include <optional>
#include <string>
#include <unistd.h>

namespace platform {

std::optional<std::string> ReadSmallFile(int directory, const std::string& path, std::size_t limit,
                                         Links links) {
    const int noFollow = links == Links::refuse ? O_NOFOLLOW : 0;
    // A pipe in the place of a file would block without O_NONBLOCK.
    const Descriptor file(
        openat(directory, path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY | noFollow));
    if (!file) return {};
    std::string text(limit, '\0');
    const auto length = read(file.get(), text.data(), limit);
    if (length < 0) return {};
    text.resize(static_cast<std::size_t>(length));
    return text;
}

} // namespace platform
