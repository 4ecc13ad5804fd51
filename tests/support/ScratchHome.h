#pragma once

#include "lib/base/Log.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

/// A home directory of the test's own, with nothing in it; gone at the end.
class ScratchHome {
public:
    ScratchHome() {
        std::string path = std::filesystem::temp_directory_path() / "kx-home-XXXXXX";
        m_path = mkdtemp(path.data());
        if (const char* home = std::getenv("HOME")) m_before = home;
        setenv("HOME", m_path.c_str(), 1);
    }
    ~ScratchHome() {
        setenv("HOME", m_before.c_str(), 1);
        std::filesystem::remove_all(m_path);
    }
    ScratchHome(const ScratchHome&) = delete;
    ScratchHome& operator=(const ScratchHome&) = delete;

    const std::filesystem::path& path() const { return m_path; }
    static std::string log(int index = 0) { return contents(LogFilePath(index)); }
    /// How often the text stands in the log.
    static int logged(const std::string& text) {
        const std::string all = log();
        int count = 0;
        for (auto at = all.find(text); at != all.npos; at = all.find(text, at + 1))
            ++count;
        return count;
    }
    static std::string contents(const std::filesystem::path& file) {
        std::ifstream stream(file);
        return {std::istreambuf_iterator<char>(stream), {}};
    }

private:
    std::filesystem::path m_path;
    std::string m_before;
};
