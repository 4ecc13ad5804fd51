#include "platform/linux/ExecLine.h"

#include "platform/linux/GObjectPointer.h"

#include <algorithm>
#include <cctype>
#include <cstddef>
#include <functional>
#include <glib.h>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace platform {

namespace {

using Documents = std::span<const std::string>;

std::string DocumentAs(char code, const std::string& url) {
    const std::string path =
        code == 'f' || code == 'F' ? TakeString(g_filename_from_uri(url.c_str(), nullptr, nullptr)) : "";
    return path.empty() ? url : path;
}

/// The field code by which a command takes documents: f, u, F or U; 0 for none.
char DocumentCode(std::span<const std::string> exec) {
    for (const auto& word : exec)
        for (std::size_t i = 0; i + 1 < word.size(); ++i)
            if (word[i] == '%' && std::string_view("fuFU%").find(word[++i]) < 4) return word[i];
    return 0;
}

std::string TextOfCode(char code, const ExecEntry& entry, Documents documents) {
    switch (code) {
    case '%':
        return "%";
    case 'c':
        return entry.name;
    case 'k':
        return entry.path;
    case 'f':
    case 'F':
    case 'u':
    case 'U':
        return documents.empty() ? "" : DocumentAs(code, documents.front());
    default:
        return {}; // those that were given up once stand for nothing
    }
}

void AppendWord(Command& command, const std::string& word, const ExecEntry& entry, Documents documents) {
    if (word == "%i") {
        if (!entry.icon.empty()) command.insert(command.end(), {"--icon", entry.icon});
        return;
    }
    if (word.size() == 2 && DocumentCode({&word, 1}) != 0) {
        for (const auto& url : documents)
            command.push_back(DocumentAs(word[1], url));
        return;
    }
    std::string& text = command.emplace_back();
    for (std::size_t i = 0; i < word.size(); ++i)
        if (word[i] != '%')
            text += word[i];
        else if (++i < word.size())
            text += TextOfCode(word[i], entry, documents);
    if (text.empty() && word.size() == 2) command.pop_back(); // a code that stands for nothing
}

Command CommandOf(std::span<const std::string> exec, const ExecEntry& entry, Documents documents) {
    Command command;
    for (const auto& word : exec)
        AppendWord(command, word, entry, documents);
    return command;
}

/// The words of a row of a table, each '%' in them replaced.
Command WordsOf(std::string_view row, std::string_view text = {}) {
    Command words(1);
    for (const char character : row)
        if (character == ' ')
            words.emplace_back();
        else if (character == '%')
            words.back() += text;
        else
            words.back() += character;
    return words;
}

} // namespace

std::vector<Command> CommandsOf(std::span<const std::string> exec, const ExecEntry& entry,
                                const std::vector<std::string>& documentURLs) {
    Command words(exec.begin(), exec.end());
    const char code = DocumentCode(words);
    if (code == 0 && !documentURLs.empty()) words.emplace_back("%f");
    const bool takesMany = code == 'F' || code == 'U';
    if (takesMany || documentURLs.size() < 2) return {CommandOf(words, entry, documentURLs)};
    std::vector<Command> commands;
    for (const auto& url : documentURLs)
        commands.push_back(CommandOf(words, entry, {&url, 1}));
    return commands;
}

Command InTerminal(const Command& command, const std::function<bool(const char*)>& isThere) {
    static constexpr std::string_view terminals[] = {"xdg-terminal-exec", "x-terminal-emulator -e",
                                                     "gnome-terminal --", "konsole -e",
                                                     "xfce4-terminal -x", "mate-terminal -x",
                                                     "qterminal -e",      "foot",
                                                     "alacritty -e",      "xterm -e"};
    for (const auto terminal : terminals) {
        auto words = WordsOf(terminal);
        if (!isThere(words.front().c_str())) continue;
        words.insert(words.end(), command.begin(), command.end());
        return words;
    }
    return {};
}

Command SettingsCommand(std::string_view currentDesktop, std::string_view pane) {
    static constexpr struct {
        std::string_view desktop, whole, page;
    } programs[] = {
        {"GNOME", "gnome-control-center", "gnome-control-center %"},
        {"KDE", "systemsettings", "systemsettings %"},
        {"XFCE", "xfce4-settings-manager", "xfce4-settings-manager --dialog=%"},
        {"LXQt", "lxqt-config", "lxqt-config-%"},
        {"X-Cinnamon", "cinnamon-settings", "cinnamon-settings %"},
        {"MATE", "mate-control-center", "mate-control-center"},
        {"Budgie", "budgie-control-center", "budgie-control-center %"},
        {"Pantheon", "io.elementary.switchboard", "io.elementary.switchboard settings://%"},
        {"Unity", "unity-control-center", "unity-control-center %"},
    };
    while (!currentDesktop.empty()) {
        const auto end = std::min(currentDesktop.find(':'), currentDesktop.size());
        for (const auto& row : programs)
            if (row.desktop == currentDesktop.substr(0, end))
                return pane.empty() ? WordsOf(row.whole) : WordsOf(row.page, pane);
        currentDesktop.remove_prefix(std::min(end + 1, currentDesktop.size()));
    }
    return {};
}

} // namespace platform
