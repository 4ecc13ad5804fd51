#include "platform/linux/ProcRecords.h"

#include "lib/base/ParseNumber.h"

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace platform {

namespace {

std::vector<std::string_view> Split(std::string_view text, char separator) {
    std::vector<std::string_view> parts;
    for (std::size_t end = 0; (end = text.find(separator)) != text.npos; text.remove_prefix(end + 1))
        parts.push_back(text.substr(0, end));
    parts.push_back(text);
    return parts;
}

bool RemoveSuffix(std::string_view& text, std::string_view suffix) {
    if (!text.ends_with(suffix)) return false;
    text.remove_suffix(suffix.size());
    return true;
}

/// "app[-<launcher>]-<id>-<random>.scope" or "app[-<launcher>]-<id>[@<random>].service".
std::optional<std::string> ApplicationIDOfUnit(std::string_view unit) {
    std::size_t partsAfterID = 0;
    if (RemoveSuffix(unit, ".scope"))
        partsAfterID = 1;
    else if (RemoveSuffix(unit, ".service"))
        unit = unit.substr(0, unit.find('@'));
    else
        return {};
    const auto parts = Split(unit, '-');
    if (parts.front() != "app" || parts.size() < 2 + partsAfterID || parts.size() > 3 + partsAfterID)
        return {};
    auto id = UnescapeUnitName(parts[parts.size() - 1 - partsAfterID]);
    if (id.empty() || id.find('/') != id.npos) return {};
    return id;
}

} // namespace

std::optional<ProcStat> ParseProcStat(std::string_view text) {
    // The name in parentheses may itself hold blanks and parentheses.
    const auto nameEnd = text.rfind(") ");
    if (nameEnd == text.npos) return {};
    const auto fields = Split(text.substr(nameEnd + 2), ' ');
    constexpr std::size_t state = 0, parent = 1, startTime = 19;
    ProcStat stat;
    if (fields.size() <= startTime || fields[state].size() != 1 ||
        !ParseNumber(fields[parent], stat.parent) || !ParseNumber(fields[startTime], stat.startTicks))
        return {};
    stat.state = fields[state].front();
    return stat;
}

std::optional<double> ParseUptime(std::string_view text) {
    double seconds = 0;
    if (!ParseNumber(text.substr(0, text.find(' ')), seconds)) return {};
    return seconds;
}

std::string_view SystemdControlGroup(std::string_view text) {
    std::string_view unified;
    for (const auto line : Split(text, '\n')) {
        const auto controllers = line.find(':');
        const auto path = line.find(':', controllers + 1);
        if (controllers == line.npos || path == line.npos) continue;
        const auto name = line.substr(controllers + 1, path - controllers - 1);
        if (name == "name=systemd") return line.substr(path + 1);
        if (name.empty()) unified = line.substr(path + 1);
    }
    return unified;
}

std::optional<std::string> ApplicationIDOfControlGroup(std::string_view path) {
    while (!path.empty()) {
        const auto slash = path.rfind('/');
        if (auto id = ApplicationIDOfUnit(path.substr(slash == path.npos ? 0 : slash + 1))) return id;
        path = path.substr(0, slash == path.npos ? 0 : slash);
    }
    return {};
}

std::string UnescapeUnitName(std::string_view name) {
    std::string plain;
    while (!name.empty()) {
        unsigned char byte = 0;
        if (name.starts_with("\\x") && name.size() >= 4 && ParseNumber(name.substr(2, 2), byte, 16)) {
            plain += static_cast<char>(byte);
            name.remove_prefix(4);
        } else {
            plain += name.front();
            name.remove_prefix(1);
        }
    }
    return plain;
}

} // namespace platform
