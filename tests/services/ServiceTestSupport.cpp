#include "ServiceTestSupport.h"

#include <csignal>
#include <fcntl.h>
#include <fstream>
#include <sys/file.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

#ifndef QV_TEST_SERVICE
#error QV_TEST_SERVICE must name the scripted test service
#endif

namespace qv::test {

using namespace qv::fen::osdep;

bool ProcessGone(int pid)
{
    if (pid <= 0)
        return true;
    if (::kill(pid, 0) != 0 && errno == ESRCH)
        return true;
    return !ProcessStartTime(pid).has_value(); // a zombie has no start time for us
}

bool WaitUntil(const std::function<bool()>& condition, std::chrono::milliseconds limit)
{
    const auto end = std::chrono::steady_clock::now() + limit;
    while (!condition()) {
        if (std::chrono::steady_clock::now() >= end)
            return condition();
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    return true;
}

ForeignMark::ForeignMark(const std::vector<std::string>& names)
{
    std::vector<std::string> paths;
    for (const std::string& name : names)
        paths.push_back(MarkPath(name));
    int ready[2];
    if (::pipe(ready) != 0)
        throw std::runtime_error("pipe");
    pid_ = ::fork();
    if (pid_ == 0) {
        for (const std::string& path : paths) {
            const int fd = ::open(path.c_str(), O_RDWR | O_CREAT, 0600);
            if (fd < 0 || ::flock(fd, LOCK_EX | LOCK_NB) != 0)
                ::_exit(1);
        }
        [[maybe_unused]] const ssize_t ignored = ::write(ready[1], "x", 1);
        for (;;)
            ::pause();
    }
    ::close(ready[1]);
    char byte = 0;
    const bool locked = ::read(ready[0], &byte, 1) == 1;
    ::close(ready[0]);
    if (!locked)
        throw std::runtime_error("the marks could not be taken");
}

ForeignMark::~ForeignMark()
{
    if (pid_ > 0) {
        ::kill(pid_, SIGKILL);
        ::waitpid(pid_, nullptr, 0);
    }
}

void ServiceTest::TearDown()
{
    // Stop everything this test started, later definitions (the dependents,
    // as a rule) first; kill whatever will not stop.
    std::vector<std::string> names;
    try {
        names = ListServiceNames();
    } catch (const std::exception& e) {
        ADD_FAILURE() << "cannot list the services to stop: " << e.what();
    }
    for (auto name = names.rbegin(); name != names.rend(); ++name) {
        try {
            StopDaemon(W(*name), true, 2000);
        } catch (const std::exception&) {
        }
        if (auto status = ReadServiceStatusFile(*name)) {
            KillDaemonProcess(true, status->processId);
            if (!ProcessGone(status->hostPid) && ProcessStartTime(status->hostPid) == status->hostStart)
                ::kill(status->hostPid, SIGKILL);
        }
    }
}

void ServiceTest::Define(const std::string& name, const std::string& options, std::vector<std::string> dependOn,
                         std::uint32_t waitHint)
{
    ServiceDefinition d;
    d.name = name;
    d.displayName = "Test service " + name;
    d.imagePath = std::string("\"") + QV_TEST_SERVICE + "\" --name " + name + " --record \"" + RecordFile() +
                  "\" " + options;
    d.dependOnService = std::move(dependOn);
    d.waitHint = waitHint;
    WriteServiceDefinition(d);
}

ServiceStatus ServiceTest::StatusOf(const std::string& name)
{
    return QueryServiceStatus(name, LoadServiceDefinition(name)->waitHint);
}

std::vector<std::string> ServiceTest::Recorded() const
{
    std::vector<std::string> lines;
    std::ifstream in(RecordFile());
    for (std::string line; std::getline(in, line);)
        lines.push_back(line);
    return lines;
}

} // namespace qv::test
