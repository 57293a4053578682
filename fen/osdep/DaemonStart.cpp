#include "fen/osdep/Daemon.h"
#include "fen/osdep/DaemonInternal.h"
#include "fen/osdep/OSException.h"
#include "fen/osdep/ServiceRuntime.h"
#include "fen/osdep/TextConversion.h"

#include <cerrno>
#include <csignal>
#include <fcntl.h>
#include <poll.h>
#include <sys/wait.h>
#include <unistd.h>

namespace qv::fen::osdep {
namespace daemon {
namespace {

/// The descriptor number the host finds its start-up report pipe on.
constexpr int kHandshakeFd = 3;
constexpr int kHandshakeTimeoutMs = 10000;

/// Closes a descriptor when it goes out of scope.
struct OwnedFd {
    int fd = -1;
    explicit OwnedFd(int value) : fd(value) {}
    ~OwnedFd()
    {
        if (fd >= 0)
            ::close(fd);
    }
    OwnedFd(const OwnedFd&) = delete;
    OwnedFd& operator=(const OwnedFd&) = delete;
};

/// Moves `fd` above the descriptors the host is given, so that setting up
/// 0 to 3 in the child never overwrites it.
int Lift(int fd)
{
    if (fd < 0 || fd > kHandshakeFd)
        return fd;
    const int lifted = ::fcntl(fd, F_DUPFD_CLOEXEC, kHandshakeFd + 1);
    ::close(fd);
    return lifted;
}

/// Reads the host's one-line start-up report: "started <pid>", "running"
/// (the mark was taken already) or "error <text>".
std::string ReadHandshake(int fd)
{
    std::string line;
    const auto end = Clock::now() + std::chrono::milliseconds(kHandshakeTimeoutMs);
    while (line.find('\n') == std::string::npos) {
        const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(end - Clock::now()).count();
        if (left <= 0)
            break;
        pollfd p{fd, POLLIN, 0};
        const int ready = ::poll(&p, 1, static_cast<int>(left));
        if (ready < 0 && errno == EINTR)
            continue;
        if (ready <= 0)
            break;
        char buffer[256];
        const ssize_t n = ::read(fd, buffer, sizeof buffer);
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0)
            break;
        line.append(buffer, static_cast<std::size_t>(n));
        if (line.size() > 4096)
            break;
    }
    const std::size_t newline = line.find('\n');
    return newline == std::string::npos ? std::string() : line.substr(0, newline);
}

/// Runs the host detached: a child that starts a new session forks the host
/// and exits, so the host belongs to no terminal and is never our zombie.
/// Between fork and exec only async-signal-safe calls are made.
std::string SpawnHost(const std::string& name, const std::vector<std::string>& arguments)
{
    const std::string host = FindProgram("wfsvchost");
    const std::string log = LogPath(name);

    OwnedFd logFd(Lift(::open(log.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0600)));
    OwnedFd nullFd(Lift(::open("/dev/null", O_RDONLY | O_CLOEXEC)));
    int pipeFds[2];
    if (logFd.fd < 0 || nullFd.fd < 0 || ::pipe2(pipeFds, O_CLOEXEC) != 0)
        QV_DAEMON_THROW(exception::ServiceFailure());
    OwnedFd readEnd(Lift(pipeFds[0]));
    OwnedFd writeEnd(Lift(pipeFds[1]));
    if (readEnd.fd < 0 || writeEnd.fd < 0)
        QV_DAEMON_THROW(exception::ServiceFailure());

    std::vector<std::string> words{host, "--handshake-fd", std::to_string(kHandshakeFd), name};
    words.insert(words.end(), arguments.begin(), arguments.end());
    std::vector<char*> argv;
    for (std::string& word : words)
        argv.push_back(word.data());
    argv.push_back(nullptr);

    const pid_t child = ::fork();
    if (child < 0)
        QV_DAEMON_THROW(exception::ServiceFailure());
    if (child == 0) {
        ::setsid();
        const pid_t grandchild = ::fork();
        if (grandchild != 0)
            ::_exit(grandchild < 0 ? 1 : 0);
        ::dup2(nullFd.fd, 0);
        ::dup2(logFd.fd, 1);
        ::dup2(logFd.fd, 2);
        ::dup2(writeEnd.fd, kHandshakeFd);
        ::close_range(kHandshakeFd + 1, ~0U, 0);
        sigset_t none;
        sigemptyset(&none);
        ::sigprocmask(SIG_SETMASK, &none, nullptr);
        if (::chdir("/") != 0)
            ::_exit(126);
        ::execv(argv[0], argv.data());
        ::_exit(127);
    }
    ::close(writeEnd.fd);
    writeEnd.fd = -1;
    int ignored = 0;
    while (::waitpid(child, &ignored, 0) < 0 && errno == EINTR) {
    }
    return ReadHandshake(readEnd.fd);
}

} // namespace

void LaunchService(const ServiceDefinition& service, const std::vector<std::string>& arguments)
{
    // Like the system's service manager, a start brings up the services
    // this one depends on first.
    for (const std::string& dependency : service.dependOnService) {
        try {
            StartDaemon(WideName(dependency), 0, nullptr, false);
        } catch (const exception::Exception&) {
            QV_DAEMON_THROW(exception::ServiceFailure());
        }
    }
    std::string report;
    try {
        report = SpawnHost(service.name, arguments);
    } catch (const exception::ServiceFailure&) {
        throw;
    } catch (const exception::Exception&) {
        QV_DAEMON_THROW(exception::ServiceFailure());
    }
    if (report.rfind("started ", 0) == 0 || report == "running")
        return;
    QV_DAEMON_THROW(exception::ServiceFailure());
}

} // namespace daemon

void StartDaemon(const WString& name, std::uint32_t argc, const char16_t* const* argv, bool startDependents)
{
    using namespace daemon;
    NestingGuard nesting;
    const ServiceDefinition service = OpenService(name);

    ServiceStatus status = QueryOrServiceFailure(service);
    if (status.state != kServiceStopped && status.state != kServiceStopPending)
        return;
    if (status.state == kServiceStopPending)
        StopDaemon(WideName(service.name), true, 0);

    std::vector<std::string> arguments;
    for (std::uint32_t i = 0; argv != nullptr && i < argc; ++i)
        if (argv[i] != nullptr)
            arguments.push_back(ToAnsi(WString(argv[i])).c_str());
    LaunchService(service, arguments);

    status = QueryOrServiceFailure(service);
    auto noted = Clock::now();
    std::uint32_t checkpoint = status.checkpoint;
    while (status.state == kServiceStartPending) {
        SleepWhileIn(service, kServiceStartPending, PollInterval(status.waitHint));
        try {
            status = Query(service);
        } catch (const WinError& e) {
            QV_DAEMON_THROW(e);
        } catch (const exception::Exception&) {
            QV_DAEMON_THROW(WinError());
        }
        if (status.checkpoint > checkpoint) {
            noted = Clock::now();
            checkpoint = status.checkpoint;
        } else if (Clock::now() - noted > std::chrono::milliseconds(status.waitHint)) {
            break;
        }
    }
    if (status.state != kServiceRunning)
        QV_DAEMON_THROW(exception::ServiceFailure());
    if (startDependents && StartDependentDaemons(WideName(service.name), startDependents) < 0)
        QV_DAEMON_THROW(exception::ServiceFailure());
}

} // namespace qv::fen::osdep
