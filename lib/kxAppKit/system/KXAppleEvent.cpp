#include "lib/kxAppKit/system/KXAppleEvent.h"

#include "lib/plist/Binary.h"
#include "lib/plist/Scalars.h"
#include "lib/plist/Value.h"
#include "platform/Status.h"

#include <cstddef>
#include <cstdlib>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

namespace {

/// The kernel takes variables of up to 128 KiB, name and end included; base64 makes 4 characters of 3 bytes.
constexpr plist::Limits limits{.bytes = std::size_t{95} << 10};

} // namespace

int KXAppleEvent::copyIntoEventRecord(std::string& record) const {
    std::string error;
    const auto encoded = plist::WriteBinary(m_properties, error, limits);
    if (encoded.pieces.empty()) return platform::status::invalidParameter;
    record = plist::textFromData(encoded.joined());
    return platform::status::success;
}

std::optional<KXAppleEvent> KXAppleEvent::ofEventRecord(std::string_view record) {
    std::string error;
    auto properties = plist::ParseBinary(plist::dataFromText(record).data(), error, limits);
    if (!properties.isDictionary()) return {};
    return KXAppleEvent(std::move(properties));
}

std::optional<KXAppleEvent> KXAppleEvent::ofThisLaunch() {
    const char* record = std::getenv(variable);
    return record != nullptr ? ofEventRecord(record) : std::nullopt;
}
