#pragma once
/// \file
/// The state of a service as the service host reports it.
///
/// The host writes "<runtime>/status/<name>" (ServiceRuntime.h) whenever the
/// state or the checkpoint changes: lines "key=value" for state, checkpoint,
/// waithint, host (the host's pid), hoststart (its start time in clock ticks
/// since boot, which tells a live host from a reused pid) and pid (the
/// service's process, which leads its own process group; 0 before it runs).
/// The mark decides: a service whose mark is free is stopped, whatever the
/// file says; a marked service whose file does not come from a live host is
/// held by someone else and counts as running.

#include <cstdint>
#include <optional>
#include <string>

namespace qv::fen::osdep {

inline constexpr std::uint32_t kServiceStopped = 1;
inline constexpr std::uint32_t kServiceStartPending = 2;
inline constexpr std::uint32_t kServiceStopPending = 3;
inline constexpr std::uint32_t kServiceRunning = 4;

struct ServiceStatus {
    std::uint32_t state = kServiceStopped;
    std::uint32_t checkpoint = 0;
    std::uint32_t waitHint = 0;
    int hostPid = 0;          ///< 0 when no host of ours holds the mark
    std::uint64_t hostStart = 0;
    int processId = 0;        ///< the service's own process, 0 when unknown
};

/// "stopped", "start-pending", "stop-pending", "running" or "unknown".
const char* ServiceStateName(std::uint32_t state) noexcept;

/// The start time of process `pid` in clock ticks since boot, or nothing
/// when there is no such process or it has exited.
std::optional<std::uint64_t> ProcessStartTime(int pid);

/// Writes the status file of `name` (used by the service host).
void WriteServiceStatus(const std::string& name, const ServiceStatus& status);

/// The status file of `name` as written, or nothing when absent or unreadable.
std::optional<ServiceStatus> ReadServiceStatusFile(const std::string& name);

/// The current status of `name`; `waitHint` fills in the wait hint of a
/// service whose host does not report one. Failures throw WinError.
ServiceStatus QueryServiceStatus(const std::string& name, std::uint32_t waitHint);

} // namespace qv::fen::osdep
