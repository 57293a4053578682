#pragma once
/// \file
/// What a service tells its host, one line at a time, on the pipe whose
/// descriptor the host puts in VAROSCOPE_SERVICE_FD:
///   CHECKPOINT                 still starting; the start may go on another wait hint
///   READY                      started: the service is running
///   WAITPORT <address> <port>  running once a TCP connection to the address succeeds
/// A service that writes nothing in its first half second counts as running
/// once it has lived that long; one that writes anything must say READY (or
/// name a port).

#include <string_view>

namespace qv::fen::osdep {

inline constexpr char kServiceNotifyVariable[] = "VAROSCOPE_SERVICE_FD";

/// Sends one line to the service host; false when there is no host to tell
/// or the line could not be sent.
bool NotifyServiceHost(std::string_view line);

/// Closes the pipe to the host and forgets it, so that a program that
/// replaces itself with another (exec) does not hand the pipe on.
void EndServiceNotify();

} // namespace qv::fen::osdep
