#pragma once

#include "lib/ipc/KXIPCMessage.h"

#include <cstdio>
#include <memory>
#include <string>

namespace tessel {

/// One line about a message: its name and direction, and a JSON object of what it says. Long lists are told
/// by their length.
std::string DigestLine(const char* direction, const KXIPCMessage& message);

/// The file in which the daemon writes down what it does, one line at a time, each written at once: every
/// message of the start menu, and every item that was launched.
class Record {
public:
    Record() = default; ///< writes nothing
    /// Appends. False, and logged, when the file cannot be written.
    bool open(const std::string& path);
    void add(const std::string& line);
    void add(const char* direction, const KXIPCMessage& message) { add(DigestLine(direction, message)); }

private:
    struct Close {
        void operator()(std::FILE* file) const { std::fclose(file); }
    };
    std::unique_ptr<std::FILE, Close> m_file;
};

} // namespace tessel
