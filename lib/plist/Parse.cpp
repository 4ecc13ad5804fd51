#include "lib/base/SharedBytes.h"
#include "lib/plist/Binary.h"
#include "lib/plist/Value.h"
#include "lib/plist/XML.h"

#include <string>
#include <string_view>

namespace plist {

Value Parse(const Data& bytes, std::string& error, const Limits& limits, const PeekBytes& peek) {
    const std::string_view text(reinterpret_cast<const char*>(bytes.data()), bytes.size());
    if (text.starts_with("bplist")) return ParseBinary(bytes, error, limits, peek);
    // A byte-order mark may come first; what then is no XML, the XML reader tells.
    if (text.find_first_of("<\xEF\xFE\xFF") == text.find_first_not_of(" \t\r\n") && !text.empty())
        return ParseXML(bytes, error, limits);
    error = "not a property list";
    return {};
}

} // namespace plist
