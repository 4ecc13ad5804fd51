#pragma once

#include "tests/support/ScratchHome.h"

#include <utility>

/// A computer of the test program's own. GLib reads where things lie once, so it stands before all else.
struct ScratchComputer {
    ScratchComputer() {
        const std::pair<const char*, std::string> variables[] = {
            {"XDG_DATA_HOME", root / "data"},
            {"XDG_DATA_DIRS", root / "system"},
            {"XDG_CONFIG_HOME", root / "config"},
            {"LANGUAGE", "de"},
            {"LC_ALL", "C.UTF-8"},
            {"XDG_CURRENT_DESKTOP", "KXTest"},
            {"DBUS_SESSION_BUS_ADDRESS", "disabled:"},
        };
        for (const auto& [name, value] : variables)
            setenv(name, value.c_str(), 1);
        std::filesystem::create_directories(root / "data/applications");
        std::filesystem::create_directories(root / "Dokumente");
        write("config/user-dirs.dirs",
              "XDG_DOCUMENTS_DIR=\"$HOME/Dokumente\"\nXDG_MUSIC_DIR=\"$HOME/gone\"\n");
    }

    std::filesystem::path write(const std::filesystem::path& path, const std::string& text) const {
        std::filesystem::create_directories((root / path).parent_path());
        std::ofstream(root / path) << text;
        return root / path;
    }
    std::string writeProgram(const std::filesystem::path& path, const std::string& text) const {
        std::filesystem::permissions(write(path, text), std::filesystem::perms::owner_all);
        return root / path;
    }
    std::string install(const std::string& id, const std::string& keys) const {
        const std::string head = "[Desktop Entry]\nType=Application\nExec=/bin/true\nName=" + id + "\n";
        return write("data/applications/" + id + ".desktop", head + keys);
    }

    const ScratchHome home;
    const std::filesystem::path root = home.path();
};

inline const ScratchComputer computer;
