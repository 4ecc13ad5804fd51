#include "fuzz/Quiet.h"
#include "lib/plist/XML.h"

// The XML reader: whatever is read can be looked at, and written and read in the other form.

extern "C" int LLVMFuzzerInitialize(int*, char***) {
    return BeQuiet();
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::string error;
    const auto value = plist::ParseXML(plist::Data::copyOf(data, size), error);
    if (value.isNil() == error.empty()) std::abort();
    if (value.isNil()) return 0;
    ReadAll(value);
    CheckRoundTrip(value);
    return 0;
}
