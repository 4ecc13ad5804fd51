#include "platform/linux/PlistUserDefaults.h"

#include "lib/base/Log.h"
#include "lib/plist/Binary.h"
#include "lib/plist/Value.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <ios>
#include <iterator>
#include <string>
#include <string_view>
#include <system_error>

namespace platform {

namespace fs = std::filesystem;

PlistUserDefaults::PlistUserDefaults(const std::string& domain) {
    const char* home = std::getenv("HOME");
    m_path = fs::path(home ? home : "/") / "Library/Preferences" / (domain + ".plist");
}

int PlistUserDefaults::integerForKey(std::string_view key) const {
    return values()[key].intValue();
}

bool PlistUserDefaults::holds(std::string_view key) const {
    return !values()[key].isNil();
}

const plist::Value& PlistUserDefaults::values() const {
    if (const Stamp stamp = currentStamp(); stamp != m_stamp) {
        m_stamp = stamp;
        m_values = stamp == Stamp{} ? plist::Value() : read();
    }
    return m_values;
}

PlistUserDefaults::Stamp PlistUserDefaults::currentStamp() const {
    std::error_code missing;
    const auto modified = fs::last_write_time(m_path, missing);
    if (missing) return {};
    const auto size = fs::file_size(m_path, missing);
    return missing ? Stamp{} : Stamp{modified, size};
}

plist::Value PlistUserDefaults::read() const {
    std::ifstream file(m_path, std::ios::binary);
    const std::string text{std::istreambuf_iterator<char>(file), {}};
    std::string error;
    auto values = plist::Parse(plist::Data::copyOf(text.data(), text.size()), error);
    if (values.isNil()) Log("cannot read the settings in %s: %s\n", m_path.c_str(), error.c_str());
    return values;
}

} // namespace platform
