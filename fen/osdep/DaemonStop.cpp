#include "fen/osdep/Daemon.h"
#include "fen/osdep/DaemonInternal.h"

#include <algorithm>
#include <csignal>
#include <unistd.h>

namespace qv::fen::osdep {
namespace daemon {
namespace {

bool IsActive(const std::string& name)
{
    const auto definition = LoadServiceDefinition(name);
    return definition && Query(*definition).state != kServiceStopped;
}

} // namespace

bool SendStopRequest(const ServiceDefinition& service)
{
    try {
        // The host is asked only when nothing that needs the service still runs.
        for (const std::string& dependent : DependentServiceNames(service.name))
            if (IsActive(dependent))
                return false;
        const ServiceStatus status = Query(service);
        if (status.state == kServiceStopped || status.hostPid <= 0)
            return false;
        return ::kill(status.hostPid, SIGTERM) == 0;
    } catch (const exception::Exception&) {
        return false;
    }
}

} // namespace daemon

void KillDaemonProcess(bool kill, int processId)
{
    if (!kill || processId <= 1 || processId == ::getpid())
        return;
    const pid_t group = ::getpgid(processId);
    if (group == processId && group != ::getpgrp())
        ::kill(-group, SIGKILL);
    else
        ::kill(processId, SIGKILL);
}

void StopDaemon(const WString& name, bool killOnTimeout, std::uint32_t timeoutMs)
{
    using namespace daemon;
    if (!killOnTimeout && timeoutMs == 0) {
        try {
            SendStopRequest(OpenService(name));
        } catch (...) {
        }
        return;
    }

    const auto deadline = Clock::now() + std::chrono::milliseconds(timeoutMs != 0 ? timeoutMs : 30000);
    const std::uint32_t effectiveTimeout = timeoutMs != 0 ? timeoutMs : 30000;
    NestingGuard nesting;
    const ServiceDefinition service = OpenService(name);
    ServiceStatus status = QueryOrServiceFailure(service);
    if (status.state == kServiceStopped)
        return;
    int processId = status.processId;

    const auto killAndFail = [&]() {
        KillDaemonProcess(killOnTimeout, processId);
        QV_DAEMON_THROW(exception::ServiceFailure());
    };
    // Sleeps one poll interval and queries again; true once stopped.
    const auto pollUntilStopped = [&](std::uint32_t waitingIn) {
        // Never past the deadline by more than a moment.
        const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(deadline - Clock::now());
        SleepWhileIn(service, waitingIn,
                     std::clamp(left, std::chrono::milliseconds(50), PollInterval(status.waitHint)));
        try {
            status = Query(service);
        } catch (const exception::Exception&) {
            killAndFail();
        }
        if (status.processId > 0)
            processId = status.processId;
        if (status.state == kServiceStopped)
            return true;
        if (Clock::now() > deadline)
            killAndFail();
        return false;
    };

    while (status.state == kServiceStopPending)
        if (pollUntilStopped(kServiceStopPending))
            return;

    // A dependent that will not stop keeps this service running; the caller
    // is told, since the service it asked to stop is still there.
    if (StopDependentDaemons(WideName(service.name), killOnTimeout, effectiveTimeout) < 0)
        QV_DAEMON_THROW(exception::ServiceFailure());

    if (!SendStopRequest(service))
        killAndFail();
    for (;;) {
        // After the request the host reports stop-pending; until it has,
        // the state it leaves is whatever it was.
        if (pollUntilStopped(status.state))
            return;
    }
}

} // namespace qv::fen::osdep
