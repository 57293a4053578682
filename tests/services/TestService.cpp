// A service whose behaviour the tests script through its arguments:
//   --checkpoints N --every MS   report N checkpoints, MS apart (default 0, 100)
//   --then ready|stall|exit      afterwards: say READY (default), say nothing
//                                more, or exit with status 1
//   --silent                     never talk to the host
//   --ignore-term                ignore SIGTERM
//   --stop-delay MS              on SIGTERM, wait MS before exiting
//   --record FILE --name NAME    append "start NAME" and "stop NAME" to FILE

#include "fen/osdep/ServiceNotify.h"

#include <chrono>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <string>
#include <thread>
#include <unistd.h>

namespace {

volatile std::sig_atomic_t stopRequested = 0;

void OnTerm(int) { stopRequested = 1; }

void Record(const std::string& file, const std::string& line)
{
    if (file.empty())
        return;
    const int fd = ::open(file.c_str(), O_WRONLY | O_CREAT | O_APPEND, 0600);
    if (fd < 0)
        return;
    const std::string text = line + "\n";
    [[maybe_unused]] const ssize_t ignored = ::write(fd, text.data(), text.size());
    ::close(fd);
}

void SleepMs(long ms) { std::this_thread::sleep_for(std::chrono::milliseconds(ms)); }

} // namespace

int main(int argc, char** argv)
{
    long checkpoints = 0, every = 100, stopDelay = 0;
    std::string then = "ready", record, name = "service";
    bool silent = false, ignoreTerm = false;
    for (int i = 1; i < argc; ++i) {
        const std::string option = argv[i];
        const char* value = i + 1 < argc ? argv[i + 1] : "";
        if (option == "--checkpoints") checkpoints = std::atol(value), ++i;
        else if (option == "--every") every = std::atol(value), ++i;
        else if (option == "--then") then = value, ++i;
        else if (option == "--stop-delay") stopDelay = std::atol(value), ++i;
        else if (option == "--record") record = value, ++i;
        else if (option == "--name") name = value, ++i;
        else if (option == "--silent") silent = true;
        else if (option == "--ignore-term") ignoreTerm = true;
        else return 2;
    }
    std::signal(SIGTERM, ignoreTerm ? SIG_IGN : OnTerm);
    Record(record, "start " + name);

    using qv::fen::osdep::NotifyServiceHost;
    for (long i = 0; i < checkpoints && !silent; ++i) {
        NotifyServiceHost("CHECKPOINT");
        SleepMs(every);
    }
    if (then == "exit")
        return 1;
    if (then == "ready" && !silent)
        NotifyServiceHost("READY");

    while (!stopRequested)
        SleepMs(20);
    SleepMs(stopDelay);
    Record(record, "stop " + name);
    return 0;
}
