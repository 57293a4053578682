#include "fen/osdep/DaemonInternal.h"

#include "fen/osdep/Daemon.h"
#include "fen/osdep/OSException.h"
#include "fen/osdep/ServiceRuntime.h"

#include <algorithm>
#include <thread>

namespace qv::fen::osdep {
namespace daemon {
namespace {

thread_local int nesting = 0;
constexpr int kMaxNesting = 32;

} // namespace

NestingGuard::NestingGuard()
{
    if (nesting >= kMaxNesting)
        QV_DAEMON_THROW(exception::ServiceFailure());
    ++nesting;
}

NestingGuard::~NestingGuard() { --nesting; }

ServiceDefinition OpenService(const WString& name)
{
    try {
        const std::string narrow = NarrowName(name);
        if (auto definition = LoadServiceDefinition(narrow)) {
            RuntimeDirectory();
            return *definition;
        }
    } catch (const exception::Exception&) {
    }
    QV_DAEMON_THROW(exception::ServiceFailure());
}

ServiceStatus Query(const ServiceDefinition& service)
{
    return QueryServiceStatus(service.name, service.waitHint);
}

ServiceStatus QueryOrServiceFailure(const ServiceDefinition& service)
{
    try {
        return Query(service);
    } catch (const exception::Exception&) {
        QV_DAEMON_THROW(exception::ServiceFailure());
    }
}

std::chrono::milliseconds PollInterval(std::uint32_t waitHint)
{
    return std::chrono::milliseconds(std::clamp<std::uint32_t>(waitHint / 10, 1000, 10000));
}

void SleepWhileIn(const ServiceDefinition& service, std::uint32_t state, std::chrono::milliseconds interval)
{
    constexpr std::chrono::milliseconds kSlice(50);
    const auto end = Clock::now() + interval;
    for (auto now = Clock::now(); now < end; now = Clock::now()) {
        std::this_thread::sleep_for(std::min<Clock::duration>(kSlice, end - now));
        try {
            if (Query(service).state != state)
                return;
        } catch (const exception::Exception&) {
            return; // the caller's own query reports it
        }
    }
}

} // namespace daemon

bool IsDaemonRunning(const WString& name)
{
    try {
        const std::string narrow = NarrowName(name);
        return IsValidServiceName(narrow) && IsMarkHeld(narrow);
    } catch (...) {
        return false;
    }
}

void EnsureRequiredDaemons()
{
    for (const std::string& name : RequiredServiceNames()) {
        const WString wide = WideName(name);
        if (!IsDaemonRunning(wide))
            StartDaemon(wide, 0, nullptr, false);
    }
}

} // namespace qv::fen::osdep
