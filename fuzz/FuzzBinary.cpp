#include "fuzz/Quiet.h"

#include <cstring>
#include <span>

// The binary codec: whatever is read can be looked at, described, written, and read again.

extern "C" int LLVMFuzzerInitialize(int*, char***) {
    return BeQuiet();
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::string error, peeked;
    // Few objects, so that time goes into new shapes and not into large ones.
    constexpr plist::Limits limits{.objects = 20'000};
    const auto bytes = plist::Data::copyOf(data, size);
    const auto value = plist::ParseBinary(bytes, error, limits);
    if (value.isNil() == error.empty()) std::abort();
    const auto peek = [&](std::size_t offset, std::span<std::byte> to) {
        std::memcpy(to.data(), bytes.data() + offset, to.size());
        return true;
    };
    if (plist::ParseBinary(bytes, peeked, limits, peek).isNil() != value.isNil() || peeked != error)
        std::abort();
    if (value.isNil()) return 0;
    ReadAll(value);
    g_seen = g_seen + value.description().size();
    CheckRoundTrip(value);
    return 0;
}
