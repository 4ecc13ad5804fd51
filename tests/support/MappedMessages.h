#pragma once

#include <cstddef>
#include <cstdlib>
#include <fstream>
#include <string>
#include <sys/types.h>

/// How many bytes of a process's address space are messages in memory.
inline std::size_t MappedMessages(pid_t process) {
    std::size_t sum = 0;
    std::ifstream maps("/proc/" + std::to_string(process) + "/maps");
    for (std::string line; std::getline(maps, line);) {
        char* end = nullptr;
        const auto start = std::strtoull(line.c_str(), &end, 16);
        if (line.find("/memfd:") != line.npos) sum += std::strtoull(end + 1, nullptr, 16) - start;
    }
    return sum;
}

/// That, looked at or not, and the anonymous memory that it has in use.
inline std::size_t HeldMemory(pid_t process) {
    std::ifstream status("/proc/" + std::to_string(process) + "/status");
    for (std::string line; std::getline(status, line);)
        if (line.starts_with("RssAnon:"))
            return MappedMessages(process) + 1024 * std::strtoull(line.c_str() + 8, nullptr, 10);
    return 0;
}
