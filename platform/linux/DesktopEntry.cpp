#include "platform/linux/DesktopEntry.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <map>
#include <optional>
#include <string>
#include <string_view>

namespace platform {

namespace {

std::string_view Trimmed(std::string_view text) {
    const auto first = text.find_first_not_of(" \t\r");
    if (first == text.npos) return {};
    return text.substr(first, text.find_last_not_of(" \t\r") - first + 1);
}

/// The escapes of every string value; they are undone before an "Exec" value is cut into words.
std::string Unescaped(std::string_view value) {
    constexpr std::string_view letters = "sntr\\", meant = " \n\t\r\\";
    std::string plain;
    for (std::size_t i = 0; i < value.size(); ++i) {
        const auto letter =
            value[i] == '\\' && i + 1 < value.size() ? letters.find(value[i + 1]) : letters.npos;
        plain += letter == letters.npos ? value[i] : meant[letter];
        if (letter != letters.npos) ++i;
    }
    return plain;
}

/// Takes the next word off `text`. Nothing at the end, and for an open quote.
std::optional<std::string> TakeWord(std::string_view& text) {
    text.remove_prefix(std::min(text.find_first_not_of(' '), text.size()));
    if (text.empty()) return {};
    std::string word;
    bool quoted = false;
    while (!text.empty() && (quoted || text.front() != ' ')) {
        const bool escape = quoted && text.front() == '\\' && text.size() > 1;
        if (escape) text.remove_prefix(1);
        if (!escape && text.front() == '"')
            quoted = !quoted;
        else
            word += text.front();
        text.remove_prefix(1);
    }
    if (quoted) return {};
    return word;
}

bool RunsWhatItIsTold(std::string_view program) {
    static constexpr std::array names = {"ash",        "bash", "dash",  "exo-open", "flatpak", "gapplication",
                                         "gtk-launch", "ksh",  "nohup", "pkexec",   "setsid",  "sh",
                                         "snap",       "su",   "sudo",  "xdg-open", "zsh"};
    program.remove_prefix(program.rfind('/') + 1);
    return std::ranges::find(names, program) != names.end();
}

} // namespace

std::map<std::string_view, std::string_view> KeyFileGroup(std::string_view text, std::string_view group) {
    std::map<std::string_view, std::string_view> entries;
    bool inGroup = false;
    while (!text.empty()) {
        const auto end = std::min(text.find('\n'), text.size());
        const auto line = Trimmed(text.substr(0, end));
        text.remove_prefix(std::min(end + 1, text.size()));
        if (line.starts_with('['))
            inGroup = line.size() == group.size() + 2 && line.substr(1, group.size()) == group &&
                      line.back() == ']';
        const auto equals = line.find('=');
        if (!inGroup || line.starts_with('#') || equals == line.npos) continue;
        entries.emplace(Trimmed(line.substr(0, equals)), Trimmed(line.substr(equals + 1)));
    }
    return entries;
}

std::optional<DesktopEntry> ParseDesktopEntry(std::string_view text) {
    auto keys = KeyFileGroup(text, "Desktop Entry");
    if (keys["Type"] != "Application" || keys["Hidden"] == "true") return {};
    DesktopEntry entry;
    entry.program = ProgramOfExec(keys["Exec"]);
    if (entry.program.empty()) entry.program = Unescaped(keys["TryExec"]);
    entry.noDisplay = keys["NoDisplay"] == "true";
    return entry;
}

std::string ProgramOfExec(std::string_view exec) {
    const auto plain = Unescaped(exec);
    std::string_view rest = plain;
    auto word = TakeWord(rest);
    const bool isEnv = word == "env" || word == "/usr/bin/env";
    if (isEnv) word = TakeWord(rest);
    while (isEnv && word && word->find('=') != word->npos)
        word = TakeWord(rest);
    if (!word || word->starts_with('-') || RunsWhatItIsTold(*word)) return {};
    return *word;
}

} // namespace platform
