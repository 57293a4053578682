#pragma once
/// \file
/// The name under which this machine is known on the network.
///
/// The name configured in the registry store (value "MachineName" of the
/// key "Software\Quorvane\Orvek" of the local machine) wins, even when
/// empty; otherwise the host name; otherwise "localhost". None of these
/// functions throws for problems of the store or the system.

#include "fen/String.h"

#include <memory>
#include <optional>
#include <string>

namespace qv::fen::osdep {

/// Where the host's own names come from; replaceable so that tests can make
/// each of them fail.
class HostNameSource {
public:
    virtual ~HostNameSource() = default;
    /// The host name (gethostname), or nothing when it fails.
    virtual std::optional<std::string> HostName() const;
    /// The kernel's node name cut to 15 characters, used when the host name
    /// cannot be had; nothing when that fails too.
    virtual std::optional<std::string> ComputerName() const;
    /// The resolver's own domain ("domain", else the first "search" entry of
    /// /etc/resolv.conf), or nothing. No query leaves the machine.
    virtual std::optional<std::string> ResolverDomain() const;
};

/// Makes `source` the source in use (null restores the system's) and
/// returns the one it replaces.
std::shared_ptr<const HostNameSource> SetHostNameSource(std::shared_ptr<const HostNameSource> source);

/// `name` completed with the machine's DNS domain: unchanged when it holds a
/// full stop; else joined with the "Domain" value of the local machine's key
/// "SYSTEM\CurrentControlSet\Services\Tcpip\Parameters" when the store has
/// one (an empty value gives the name and a full stop), else with the
/// resolver's domain; a domain that begins with a full stop is joined
/// without another.
WString CompleteWithDomain(const WString& name);

/// The machine's network name; with `fullyQualified` completed with the
/// domain (not when it had to come from the node name).
WString GetLocalHostName(bool fullyQualified);

/// The short network name, computed once per process; safe from any thread.
const WString& GetCachedLocalHostName();

/// Forgets the cached name, so that a test can compute it again.
void ResetCachedLocalHostNameForTesting();

} // namespace qv::fen::osdep
