#pragma once

#include <csignal>
#include <functional>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

/// A process that works until it is killed, and stays a zombie until its end here. Started by a process of
/// one thread.
class Worker {
public:
    explicit Worker(const std::function<void()>& work)
        : m_pid(fork()) {
        if (m_pid != 0) return;
        prctl(PR_SET_PDEATHSIG, SIGKILL);
        work();
        _exit(1);
    }
    ~Worker() { end(); }
    Worker(const Worker&) = delete;
    Worker& operator=(const Worker&) = delete;

    pid_t pid() const { return m_pid; }
    void end() const {
        if (waitpid(m_pid, nullptr, WNOHANG) != 0) return;
        ::kill(m_pid, SIGKILL);
        waitpid(m_pid, nullptr, 0);
    }

private:
    const pid_t m_pid;
};

/// One that has done its work when the constructor returns, and stands still from then on.
class Child : public Worker {
public:
    explicit Child(const std::function<void()>& work = [] {})
        : Worker([&] {
            work();
            raise(SIGSTOP);
        }) {
        waitpid(pid(), nullptr, WUNTRACED);
    }
};
