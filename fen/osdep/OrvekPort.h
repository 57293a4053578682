#pragma once
/// \file
/// Where this host's data server listens: the local machine's key
/// "SOFTWARE\Quorvane\Orvek" in the registry store, value "DataPort"
/// (kRegDword; 18883 is written there when it is absent, leaving the usual
/// MQTT port to any other broker of the machine) and value
/// "DataBindAddress" (kRegSz; an IP address, empty for every interface).

#include "fen/String.h"

#include <cstdint>

namespace qv::fen::osdep {

inline constexpr std::uint16_t kDefaultOrvekDataPort = 18883;

/// The Orvek data port; the default is stored on first use. A stored value
/// that is no port (0 or above 65535) throws InvalidArgument; store
/// failures throw WinError.
std::uint16_t GetOrvekDataPort();

/// The address the data server binds to; empty for every interface.
WString GetOrvekDataBindAddress();

} // namespace qv::fen::osdep
