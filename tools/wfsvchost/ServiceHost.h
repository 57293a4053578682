#pragma once
// The work of the service host, apart from its command line.

#include <string>
#include <vector>

namespace qv::tools {

inline constexpr int kHostStopped = 0;
inline constexpr int kHostFailed = 1;
inline constexpr int kHostUsage = 2;
inline constexpr int kHostAlreadyRunning = 3;

/// Runs the service `name` with `arguments` appended to its command line
/// until it stops; returns the host's exit code. `handshakeFd` (or -1)
/// receives the one-line start-up report.
int RunServiceHost(const std::string& name, const std::vector<std::string>& arguments, int handshakeFd);

} // namespace qv::tools
