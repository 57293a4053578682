#pragma once
// A program run as a child process of a test, its standard output
// collected; killed if it is still running when the object goes.

#include <cerrno>
#include <chrono>
#include <csignal>
#include <functional>
#include <poll.h>
#include <stdexcept>
#include <string>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace qv::test {

class ChildProcess {
public:
    ChildProcess(std::string program, std::vector<std::string> arguments)
    {
        int pipeEnds[2];
        if (pipe(pipeEnds) != 0)
            throw std::runtime_error("pipe failed");
        arguments.insert(arguments.begin(), std::move(program));
        // Built before fork: the child of a threaded test may only exec.
        std::vector<char*> argv;
        for (auto& argument : arguments)
            argv.push_back(argument.data());
        argv.push_back(nullptr);
        pid_ = fork();
        if (pid_ == 0) {
            dup2(pipeEnds[1], STDOUT_FILENO);
            close(pipeEnds[0]);
            close(pipeEnds[1]);
            execv(argv[0], argv.data());
            _exit(127);
        }
        close(pipeEnds[1]);
        output_ = pipeEnds[0];
    }
    ~ChildProcess()
    {
        if (pid_ > 0) {
            kill(pid_, SIGKILL);
            waitpid(pid_, nullptr, 0);
        }
        close(output_);
    }
    ChildProcess(const ChildProcess&) = delete;
    ChildProcess& operator=(const ChildProcess&) = delete;

    void Signal(int signal) { kill(pid_, signal); }

    /// The exit code once the program ends within `timeout`; -1 otherwise
    /// (it is killed then) or when a signal ended it.
    int Wait(std::chrono::milliseconds timeout)
    {
        const auto deadline = std::chrono::steady_clock::now() + timeout;
        int status = 0;
        while (waitpid(pid_, &status, WNOHANG) == 0) {
            if (std::chrono::steady_clock::now() > deadline) {
                kill(pid_, SIGKILL);
                waitpid(pid_, &status, 0);
                pid_ = -1;
                return -1;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        pid_ = -1;
        return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    }

    /// Everything the program wrote to its standard output: what it wrote
    /// after the latest ReadUntil (call after Wait).
    std::string Output()
    {
        std::string text;
        char buffer[4096];
        ssize_t count;
        while ((count = read(output_, buffer, sizeof buffer)) > 0 || (count < 0 && errno == EINTR))
            if (count > 0)
                text.append(buffer, static_cast<std::size_t>(count));
        return text;
    }

    /// Reads the output as it comes until `done(everything so far)` holds
    /// or `timeout` passes; returns everything read.
    std::string ReadUntil(const std::function<bool(const std::string&)>& done, std::chrono::milliseconds timeout)
    {
        const auto deadline = std::chrono::steady_clock::now() + timeout;
        std::string text;
        char buffer[4096];
        while (!done(text)) {
            const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(
                deadline - std::chrono::steady_clock::now());
            if (left.count() <= 0)
                break;
            pollfd ready{output_, POLLIN, 0};
            if (poll(&ready, 1, static_cast<int>(left.count())) <= 0)
                continue;
            const ssize_t count = read(output_, buffer, sizeof buffer);
            if (count == 0)
                break; // the program ended
            if (count > 0)
                text.append(buffer, static_cast<std::size_t>(count));
        }
        return text;
    }

private:
    pid_t pid_ = -1;
    int output_ = -1;
};

} // namespace qv::test
