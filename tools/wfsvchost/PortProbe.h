#pragma once
// Whether a TCP address accepts connections, for services that are ready
// once they listen.

#include <string>

namespace qv::tools {

/// True when a connection to `address`:`port` (numeric IPv4 or IPv6)
/// succeeds within `timeoutMs`; the connection is closed at once.
bool AcceptsConnections(const std::string& address, const std::string& port, int timeoutMs);

} // namespace qv::tools
