#pragma once
/// \file
/// Pieces shared by the service-control functions of Daemon.h.

#include "fen/Exception.h"
#include "fen/String.h"
#include "fen/osdep/ServiceDefinition.h"
#include "fen/osdep/ServiceStatus.h"

#include <chrono>
#include <cstdint>
#include <string>
#include <vector>

namespace qv::fen::osdep::daemon {

/// The source name stamped on the exceptions of service control.
inline constexpr char kSource[] = "qv\\fen\\osdep\\Daemon";

#define QV_DAEMON_THROW(e) \
    throw ::qv::fen::exception::WithSourceLocation((e), ::qv::fen::osdep::daemon::kSource, __LINE__)

using Clock = std::chrono::steady_clock;

/// The definition of `name`; ServiceFailure when there is none or the store
/// or the runtime directory cannot be used.
ServiceDefinition OpenService(const WString& name);

/// The current status of a defined service; WinError on failure.
ServiceStatus Query(const ServiceDefinition& service);

/// As Query, but any failure is ServiceFailure.
ServiceStatus QueryOrServiceFailure(const ServiceDefinition& service);

/// Wait hint / 10, clamped to 1000..10000 ms.
std::chrono::milliseconds PollInterval(std::uint32_t waitHint);

/// Sleeps for `interval`, or less once the service has left `state`.
void SleepWhileIn(const ServiceDefinition& service, std::uint32_t state, std::chrono::milliseconds interval);

/// Starts the service's dependencies and then its host, and waits for the
/// host to take the mark; a host that finds the mark taken counts as
/// success. Every failure throws ServiceFailure.
void LaunchService(const ServiceDefinition& service, const std::vector<std::string>& arguments);

/// Asks the service's host to stop it; false when that cannot be done
/// (not running, held by someone else, or dependents still active).
bool SendStopRequest(const ServiceDefinition& service);

/// Limits how deep starts and stops may nest through dependencies, so that
/// a circle of definitions fails instead of recursing without end.
class NestingGuard {
public:
    NestingGuard();
    ~NestingGuard();
    NestingGuard(const NestingGuard&) = delete;
    NestingGuard& operator=(const NestingGuard&) = delete;
};

} // namespace qv::fen::osdep::daemon
