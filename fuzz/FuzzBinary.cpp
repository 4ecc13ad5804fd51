#include "fuzz/Quiet.h"

// The binary codec: whatever is read can be looked at, described, written, and read again.

extern "C" int LLVMFuzzerInitialize(int*, char***) {
    return BeQuiet();
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::string error;
    // Few objects, so that time goes into new shapes and not into large ones.
    const auto value = plist::ParseBinary(plist::Data::copyOf(data, size), error, {.objects = 20'000});
    if (value.isNil() == error.empty()) std::abort();
    if (value.isNil()) return 0;
    ReadAll(value);
    g_seen = g_seen + value.description().size();
    CheckRoundTrip(value);
    return 0;
}
