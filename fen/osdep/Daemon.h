#pragma once
/// \file
/// Control of this machine's network services: whether one runs, starting
/// one and waiting for it, stopping one with a deadline, its dependents.
///
/// A service is defined in the registry store (ServiceDefinition.h) and run
/// by the service host `wfsvchost`, which marks it as running by holding an
/// exclusive lock on "<runtime>/Global/<name>" and reports its state
/// (ServiceStatus.h). States: 1 stopped, 2 start-pending, 3 stop-pending,
/// 4 running. Waits poll every wait hint / 10 ms, at least 1000 and at most
/// 10000 ms, and return early once the state they wait on has changed.
///
/// Failures of StartDaemon and of the full StopDaemon throw ServiceFailure
/// stamped with the source name "qv\fen\osdep\Daemon"; the dependent-service
/// functions never throw and return a status instead.

#include "fen/String.h"

#include <cstdint>

namespace qv::fen::osdep {

/// Status of the dependent-service functions: success, a system error
/// (0x80070000 | code), out of memory, and a dependent that failed.
inline constexpr std::int32_t kDaemonOk = 0;
inline constexpr std::int32_t kDaemonOutOfMemory = static_cast<std::int32_t>(0x8007000Eu);
inline constexpr std::int32_t kDaemonFailed = static_cast<std::int32_t>(0x80004005u);

/// True when the mark of `name` is held, by a service host or anyone else.
/// Never throws; any failure reads as not running.
bool IsDaemonRunning(const WString& name);

/// Starts `name` unless it is running, start-pending or in another active
/// state (then it returns at once), and waits while it is start-pending and
/// its checkpoint keeps growing within the wait hint. A stop-pending service
/// is stopped first (killed after 30 s). Services in its DependOnService
/// are started before it. `argv` (argc entries) are appended to its command
/// line. With `startDependents`, its stopped dependents are started after it.
void StartDaemon(const WString& name, std::uint32_t argc, const char16_t* const* argv, bool startDependents);

/// With `killOnTimeout` false and `timeoutMs` 0: asks the service to stop
/// and returns at once, never throwing. Otherwise stops its running
/// dependents, then the service, within `timeoutMs` (30000 when 0) from the
/// call; past the deadline, or when a stop cannot be asked for, the service
/// process is killed when `killOnTimeout` is set, and ServiceFailure is
/// thrown. A dependent that cannot be stopped throws ServiceFailure too,
/// leaving the service running.
void StopDaemon(const WString& name, bool killOnTimeout, std::uint32_t timeoutMs);

/// Starts each stopped service that depends on `service`, in stored order.
std::int32_t StartDependentDaemons(const WString& service, bool startDependents);

/// Stops each active service that depends on `service`, in stored order,
/// each within `timeoutMs` from its own start.
std::int32_t StopDependentDaemons(const WString& service, bool killOnTimeout, std::uint32_t timeoutMs);

/// With `kill` set, kills `processId` and, when it leads a process group
/// (as a service process does), the whole group. Pids 0 and 1, this process
/// and this process's group are never touched.
void KillDaemonProcess(bool kill, int processId);

/// Starts, in this order, each of "WfClassAds", "WfTimeSync" and
/// "WfCairnetServer" that is not marked as running; the first failure
/// propagates and the rest are not tried.
void EnsureRequiredDaemons();

} // namespace qv::fen::osdep
