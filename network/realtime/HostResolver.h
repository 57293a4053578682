#pragma once
/// \file
/// How the real-time library finds the address of a host: the one place
/// where host names are looked up, replaceable so that tests resolve names
/// from a table instead of asking DNS.

#include <memory>
#include <optional>
#include <string>

namespace qv::network::realtime {

class HostResolver {
public:
    virtual ~HostResolver() = default;
    /// The numeric address (IPv4 or IPv6 text) of `host` (UTF-8), or nothing
    /// when the name does not resolve. Called on a connection's thread; may block.
    virtual std::optional<std::string> Resolve(const std::string& host) const = 0;
};

/// The resolver of the system (getaddrinfo).
class SystemHostResolver : public HostResolver {
public:
    std::optional<std::string> Resolve(const std::string& host) const override;
};

/// Makes `resolver` the one in use (null restores the system's) and returns
/// the one it replaces. Connections made afterwards use it.
std::shared_ptr<const HostResolver> SetHostResolver(std::shared_ptr<const HostResolver> resolver);

/// The address to connect to for the host `host` of an item URL (UTF-8):
/// 127.0.0.1 for the local machine's own name (any letter case), for
/// "localhost" and for the empty name of a local URL, the text itself for
/// an IP address, otherwise what the resolver in use answers.
std::optional<std::string> AddressOfHost(const std::string& host);

} // namespace qv::network::realtime
