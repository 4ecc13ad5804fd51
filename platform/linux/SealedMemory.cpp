#include "platform/linux/SealedMemory.h"

#include "lib/base/SharedBytes.h"
#include "platform/linux/Descriptor.h"

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstddef>
#include <fcntl.h>
#include <memory>
#include <optional>
#include <span>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/types.h>
#include <sys/uio.h>
#include <unistd.h>
#include <utility>
#include <vector>

namespace platform {

namespace {

constexpr int requiredSeals = F_SEAL_SEAL | F_SEAL_SHRINK | F_SEAL_GROW | F_SEAL_WRITE;

bool WriteAll(int file, std::span<iovec> rest) {
    while (!rest.empty()) {
        const auto batch = std::min<std::size_t>(rest.size(), IOV_MAX);
        const auto written = writev(file, rest.data(), static_cast<int>(batch));
        if (written < 0 && errno == EINTR) continue;
        if (written < 0) return false;
        auto left = static_cast<std::size_t>(written);
        while (!rest.empty() && left >= rest.front().iov_len) {
            left -= rest.front().iov_len;
            rest = rest.subspan(1);
        }
        if (left == 0) continue;
        rest.front().iov_base = static_cast<std::byte*>(rest.front().iov_base) + left;
        rest.front().iov_len -= left;
    }
    return true;
}

} // namespace

Descriptor WriteSealedMemory(BytePieces pieces) {
    std::vector<iovec> vectors;
    for (const auto piece : pieces)
        vectors.push_back({const_cast<std::byte*>(piece.data()), piece.size()});
    Descriptor memory(memfd_create("message", MFD_CLOEXEC | MFD_ALLOW_SEALING));
    // Writing through a mapping looks faster, and takes twice as long.
    if (!memory || !WriteAll(memory.get(), vectors) || fcntl(memory.get(), F_ADD_SEALS, requiredSeals) != 0)
        return {};
    return memory;
}

std::optional<SharedBytes> MapSealedMemory(const Descriptor& memory, std::size_t size) {
    struct stat status = {};
    const int seals = fcntl(memory.get(), F_GET_SEALS);
    if (seals < 0 || (seals & requiredSeals) != requiredSeals || fstat(memory.get(), &status) != 0 ||
        std::cmp_not_equal(status.st_size, size) || size == 0)
        return std::nullopt;
    // A private mapping shares the pages all the same; a shared one of sealed memory is refused by older
    // kernels.
    const auto* mapping = mmap(nullptr, size, PROT_READ, MAP_PRIVATE, memory.get(), 0);
    if (mapping == MAP_FAILED) return std::nullopt;
    const std::shared_ptr<const void> owner(
        mapping, [size](const void* start) { munmap(const_cast<void*>(start), size); });
    return SharedBytes({static_cast<const std::byte*>(mapping), size}, owner);
}

PeekBytes PeekIntoMemory(Descriptor memory) {
    return [memory = std::make_shared<const Descriptor>(std::move(memory))](std::size_t offset,
                                                                            std::span<std::byte> to) {
        return std::cmp_equal(pread(memory->get(), to.data(), to.size(), static_cast<off_t>(offset)),
                              to.size());
    };
}

} // namespace platform
