#include "ServiceHost.h"

#include "PortProbe.h"
#include "fen/Exception.h"
#include "fen/osdep/ServiceCommandLine.h"
#include "fen/osdep/ServiceDefinition.h"
#include "fen/osdep/ServiceNotify.h"
#include "fen/osdep/ServiceRuntime.h"
#include "fen/osdep/ServiceStatus.h"

#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <optional>
#include <stdexcept>
#include <poll.h>
#include <sstream>
#include <sys/file.h>
#include <sys/prctl.h>
#include <sys/signalfd.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace qv::tools {
namespace {

using namespace qv::fen::osdep;
using Clock = std::chrono::steady_clock;

/// A service that says nothing is taken as running after this long.
constexpr std::chrono::milliseconds kSettleTime(500);
/// How often a service waiting for its port is probed.
constexpr int kProbeIntervalMs = 100;

void Log(const std::string& name, const std::string& text)
{
    std::fprintf(stderr, "wfsvchost[%d] %s: %s\n", static_cast<int>(::getpid()), name.c_str(), text.c_str());
    std::fflush(stderr);
}

/// The one-line report to the starter; sent at most once.
class Handshake {
public:
    explicit Handshake(int fd) : fd_(fd)
    {
        if (fd_ >= 0)
            ::fcntl(fd_, F_SETFD, FD_CLOEXEC);
    }
    ~Handshake() { Close(); }
    void Send(const std::string& line)
    {
        if (fd_ < 0)
            return;
        const std::string text = line + "\n";
        [[maybe_unused]] const ssize_t ignored = ::write(fd_, text.data(), text.size());
        Close();
    }

private:
    void Close()
    {
        if (fd_ >= 0)
            ::close(fd_);
        fd_ = -1;
    }
    int fd_;
};

/// Takes the exclusive mark. A tester's brief shared lock may be in the way
/// for an instant, so a refusal is retried for a moment before the mark
/// counts as held by another process.
bool TakeMark(int fd)
{
    for (int attempt = 0; attempt < 20; ++attempt) {
        if (::flock(fd, LOCK_EX | LOCK_NB) == 0)
            return true;
        if (errno != EWOULDBLOCK && errno != EINTR)
            return false;
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    return false;
}

class Host {
public:
    Host(const ServiceDefinition& definition, int signalFd) : definition_(definition), signalFd_(signalFd)
    {
        status_.state = kServiceStartPending;
        status_.waitHint = definition.waitHint;
        status_.hostPid = static_cast<int>(::getpid());
        status_.hostStart = ProcessStartTime(status_.hostPid).value_or(0);
    }

    void Report() { WriteServiceStatus(definition_.name, status_); }

    void ReportStopped()
    {
        status_.state = kServiceStopped;
        status_.checkpoint = 0;
        try {
            Report();
        } catch (const fen::exception::Exception& e) {
            Log(definition_.name, std::string("cannot report the stop: ") + e.what());
        }
    }

    /// Starts the service's process; throws on failure.
    void Launch(const std::vector<std::string>& words)
    {
        int notify[2];
        if (::pipe2(notify, O_CLOEXEC) != 0)
            throw std::runtime_error(std::string("pipe: ") + std::strerror(errno));
        ::setenv(kServiceNotifyVariable, std::to_string(notify[1]).c_str(), 1);
        std::vector<char*> argv;
        std::vector<std::string> copy = words;
        for (std::string& word : copy)
            argv.push_back(word.data());
        argv.push_back(nullptr);

        const pid_t host = ::getpid();
        const pid_t child = ::fork();
        if (child < 0)
            throw std::runtime_error(std::string("fork: ") + std::strerror(errno));
        if (child == 0) {
            // Its own process group, so that a stop or a kill reaches all
            // of it; and it is told to stop when the host dies.
            ::setpgid(0, 0);
            ::prctl(PR_SET_PDEATHSIG, SIGTERM);
            if (::getppid() != host)
                ::_exit(127);
            ::fcntl(notify[1], F_SETFD, 0);
            sigset_t none;
            sigemptyset(&none);
            ::sigprocmask(SIG_SETMASK, &none, nullptr);
            ::signal(SIGPIPE, SIG_DFL);
            ::execvp(argv[0], argv.data());
            std::fprintf(stderr, "wfsvchost: cannot run %s: %s\n", argv[0], std::strerror(errno));
            ::_exit(127);
        }
        ::setpgid(child, child);
        ::close(notify[1]);
        ::unsetenv(kServiceNotifyVariable);
        notifyFd_ = notify[0];
        child_ = child;
        started_ = Clock::now();
        status_.processId = static_cast<int>(child);
        Report();
        Log(definition_.name, "start-pending, service process " + std::to_string(child));
    }

    /// Serves the running service until its process has ended.
    void Run()
    {
        while (child_ > 0) {
            pollfd fds[2] = {{signalFd_, POLLIN, 0}, {notifyFd_, POLLIN, 0}};
            const int count = notifyFd_ >= 0 ? 2 : 1;
            const int timeout = status_.state == kServiceStartPending ? kProbeIntervalMs : -1;
            const int ready = ::poll(fds, count, timeout);
            if (ready < 0 && errno != EINTR)
                throw std::runtime_error(std::string("poll: ") + std::strerror(errno));
            if (ready > 0 && (fds[0].revents & POLLIN))
                HandleSignals();
            if (ready > 0 && count == 2 && (fds[1].revents & (POLLIN | POLLHUP | POLLERR)))
                HandleNotifications();
            if (status_.state == kServiceStartPending)
                CheckReadiness();
        }
        if (notifyFd_ >= 0)
            ::close(notifyFd_);
    }

private:
    void SetState(std::uint32_t state)
    {
        status_.state = state;
        status_.checkpoint = 0;
        Report();
        Log(definition_.name, ServiceStateName(state));
    }

    void BeginStop()
    {
        if (status_.state == kServiceStopPending)
            return;
        SetState(kServiceStopPending);
        if (::kill(-child_, SIGTERM) != 0)
            ::kill(child_, SIGTERM);
    }

    void HandleSignals()
    {
        signalfd_siginfo info{};
        while (::read(signalFd_, &info, sizeof info) == static_cast<ssize_t>(sizeof info)) {
            if (info.ssi_signo == SIGTERM || info.ssi_signo == SIGINT)
                BeginStop();
        }
        int code = 0;
        const pid_t ended = ::waitpid(child_, &code, WNOHANG);
        if (ended == child_) {
            if (WIFEXITED(code))
                Log(definition_.name, "service process exited with status " + std::to_string(WEXITSTATUS(code)));
            else if (WIFSIGNALED(code))
                Log(definition_.name, "service process ended by signal " + std::to_string(WTERMSIG(code)));
            child_ = 0;
        }
    }

    void HandleNotifications()
    {
        char buffer[512];
        const ssize_t n = ::read(notifyFd_, buffer, sizeof buffer);
        if (n < 0 && errno == EINTR)
            return;
        if (n <= 0) {
            ::close(notifyFd_);
            notifyFd_ = -1;
            return;
        }
        pending_.append(buffer, static_cast<std::size_t>(n));
        for (std::size_t newline; (newline = pending_.find('\n')) != std::string::npos;) {
            const std::string line = pending_.substr(0, newline);
            pending_.erase(0, newline + 1);
            HandleLine(line);
        }
        if (pending_.size() > 4096)
            pending_.clear();
    }

    void HandleLine(const std::string& line)
    {
        heardFrom_ = true;
        if (status_.state != kServiceStartPending)
            return;
        std::istringstream words(line);
        std::string word;
        words >> word;
        if (word == "CHECKPOINT") {
            ++status_.checkpoint;
            Report();
        } else if (word == "READY") {
            SetState(kServiceRunning);
        } else if (word == "WAITPORT") {
            std::string address, port;
            if (words >> address >> port)
                probe_ = std::make_pair(address, port);
        }
    }

    void CheckReadiness()
    {
        if (probe_) {
            if (AcceptsConnections(probe_->first, probe_->second, kProbeIntervalMs))
                SetState(kServiceRunning);
        } else if (!heardFrom_ && Clock::now() - started_ >= kSettleTime) {
            SetState(kServiceRunning);
        }
    }

    const ServiceDefinition& definition_;
    int signalFd_;
    ServiceStatus status_;
    pid_t child_ = 0;
    int notifyFd_ = -1;
    Clock::time_point started_;
    bool heardFrom_ = false;
    std::string pending_;
    std::optional<std::pair<std::string, std::string>> probe_;
};

} // namespace

int RunServiceHost(const std::string& requested, const std::vector<std::string>& arguments, int handshakeFd)
{
    Handshake handshake(handshakeFd);
    ::signal(SIGPIPE, SIG_IGN);
    ::signal(SIGHUP, SIG_IGN);
    sigset_t handled;
    sigemptyset(&handled);
    sigaddset(&handled, SIGTERM);
    sigaddset(&handled, SIGINT);
    sigaddset(&handled, SIGCHLD);
    ::sigprocmask(SIG_BLOCK, &handled, nullptr);
    const int signalFd = ::signalfd(-1, &handled, SFD_CLOEXEC | SFD_NONBLOCK);
    if (signalFd < 0) {
        Log(requested, std::string("signalfd: ") + std::strerror(errno));
        handshake.Send("error cannot watch signals");
        return kHostFailed;
    }

    std::optional<ServiceDefinition> definition;
    int markFd = -1;
    try {
        definition = LoadServiceDefinition(requested);
        if (!definition) {
            Log(requested, "no such service");
            handshake.Send("error no such service");
            return kHostFailed;
        }
        const std::string path = MarkPath(definition->name);
        markFd = ::open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW, 0600);
        if (markFd < 0)
            throw std::runtime_error("cannot open " + path + ": " + std::strerror(errno));
    } catch (const std::exception& e) {
        Log(requested, e.what());
        handshake.Send(std::string("error ") + e.what());
        return kHostFailed;
    }
    if (!TakeMark(markFd)) {
        Log(definition->name, "already running");
        handshake.Send("running");
        return kHostAlreadyRunning;
    }

    Host host(*definition, signalFd);
    try {
        host.Report();
        ::setenv("VAROSCOPE_BIN_DIR", BinDirectory().c_str(), 1);
        std::vector<std::string> words = SplitCommandLine(definition->imagePath);
        words.insert(words.end(), arguments.begin(), arguments.end());
        if (words.empty())
            throw std::runtime_error("empty command line");
        host.Launch(words);
    } catch (const std::exception& e) {
        Log(definition->name, std::string("cannot start: ") + e.what());
        host.ReportStopped();
        handshake.Send(std::string("error ") + e.what());
        return kHostFailed;
    }
    handshake.Send("started " + std::to_string(::getpid()));

    int code = kHostStopped;
    try {
        host.Run();
    } catch (const std::exception& e) {
        Log(definition->name, e.what());
        code = kHostFailed;
    }
    host.ReportStopped();
    Log(definition->name, "stopped");
    // The mark goes with the process: the kernel drops the lock at exit.
    return code;
}

} // namespace qv::tools
