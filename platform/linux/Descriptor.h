#pragma once

#include <unistd.h>
#include <utility>

namespace platform {

/// Owns a file descriptor; -1 is none.
class Descriptor {
public:
    Descriptor() = default;
    explicit Descriptor(int number)
        : m_number(number) {}
    Descriptor(Descriptor&& other) noexcept
        : m_number(std::exchange(other.m_number, -1)) {}
    Descriptor& operator=(Descriptor&& other) noexcept {
        if (this != &other) reset(std::exchange(other.m_number, -1));
        return *this;
    }
    ~Descriptor() { reset(); }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;

    explicit operator bool() const { return m_number >= 0; }
    int get() const { return m_number; }
    void reset(int number = -1) {
        if (m_number >= 0) ::close(m_number);
        m_number = number;
    }

private:
    int m_number = -1;
};

} // namespace platform
