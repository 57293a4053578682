// wftimesync: the service "WfTimeSync". Watches the clock's
// synchronisation: every few seconds it reads the kernel's time-keeping
// state (ntp_adjtime, read only, so no privilege is needed) and writes
// "<runtime>/timesync.json": whether the clock is synchronised, the
// kernel's clock state, the estimated and maximum error and the offset in
// microseconds. The timestamps of the network's values are only as good as
// this clock. The file is replaced atomically and removed on stop.
//
// Usage: wftimesync [--interval MS]   (default 5000)

#include "common/DaemonLoop.h"
#include "fen/osdep/ServiceRuntime.h"

#include <cerrno>
#include <clocale>
#include <cstring>
#include <sstream>
#include <stdexcept>
#include <sys/timex.h>
#include <unistd.h>

namespace {

const char* ClockStateName(int state)
{
    switch (state) {
    case TIME_OK: return "ok";
    case TIME_INS: return "leap second insert";
    case TIME_DEL: return "leap second delete";
    case TIME_OOP: return "leap second in progress";
    case TIME_WAIT: return "leap second done";
    case TIME_ERROR: return "unsynchronised";
    default: return "unknown";
    }
}

std::string Record()
{
    timex reading{};
    reading.modes = 0;
    const int state = ::ntp_adjtime(&reading);
    if (state < 0)
        throw std::runtime_error(std::string("ntp_adjtime: ") + std::strerror(errno));
    const bool synchronised = state != TIME_ERROR && (reading.status & STA_UNSYNC) == 0;
    // The offset is in nanoseconds when the kernel says so.
    const long offsetUs = (reading.status & STA_NANO) ? reading.offset / 1000 : reading.offset;
    std::ostringstream out;
    out << "{\n  \"time\": " << qv::tools::JsonString(qv::tools::UtcTimeText())
        << ",\n  \"synchronised\": " << (synchronised ? "true" : "false")
        << ",\n  \"clockState\": " << qv::tools::JsonString(ClockStateName(state))
        << ",\n  \"estimatedErrorUs\": " << reading.esterror << ",\n  \"maximumErrorUs\": " << reading.maxerror
        << ",\n  \"offsetUs\": " << offsetUs << ",\n  \"status\": " << reading.status << "\n}\n";
    return out.str();
}

} // namespace

int main(int argc, char** argv)
{
    std::setlocale(LC_ALL, "");
    const auto interval = qv::tools::IntervalOption(argc, argv, std::chrono::milliseconds(5000));
    std::string path;
    return qv::tools::RunPeriodicService(
        "wftimesync", interval,
        [&] {
            if (path.empty())
                path = qv::fen::osdep::RuntimeDirectory() + "/timesync.json";
            qv::fen::osdep::ReplaceFile(path, Record());
        },
        [&] {
            if (!path.empty())
                ::unlink(path.c_str());
        });
}
