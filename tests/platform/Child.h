#pragma once

#include <csignal>
#include <functional>
#include <sys/wait.h>
#include <unistd.h>

/// A process that has done its work when the constructor returns; then it stands still until it is killed,
/// and stays a zombie until its end here. Started by a process of one thread.
class Child {
public:
    explicit Child(const std::function<void()>& work = [] {})
        : m_pid(fork()) {
        if (m_pid == 0) {
            work();
            raise(SIGSTOP);
            _exit(0);
        }
        waitpid(m_pid, nullptr, WUNTRACED);
    }
    ~Child() { end(); }
    Child(const Child&) = delete;
    Child& operator=(const Child&) = delete;

    int pid() const { return m_pid; }
    void end() const {
        if (waitpid(m_pid, nullptr, WNOHANG) != 0) return;
        ::kill(m_pid, SIGKILL);
        waitpid(m_pid, nullptr, 0);
    }

private:
    const pid_t m_pid;
};
