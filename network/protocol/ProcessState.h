#pragma once
/// \file
/// The process state message, retained on "orvek/v1/<process>/state".
///
///     {"v":1, "state":"running", "pid":4711, "since":{"s":"...","f":"..."}}
///
/// A publisher publishes "running" once connected, "stopped" before an
/// orderly disconnect, and leaves the broker a Last Will of LastWillPayload()
/// (retained), which the broker publishes as "failed" when the process
/// vanishes. No state message at all means the process does not exist.

#include "fen/AbsTime.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace qv::network::protocol {

enum class RunState {
    Running, ///< "running"
    Stopped, ///< "stopped"
    Failed,  ///< "failed"
};

struct ProcessState {
    RunState state = RunState::Running;
    /// The process id, from 1 to 2^31 - 1, when known.
    std::optional<std::int32_t> pid;
    /// When the process entered `state`, when known.
    std::optional<fen::AbsTime> since;
};

/// The message as UTF-8 JSON; a pid outside 1 to 2^31 - 1 throws InvalidArgument.
std::string EncodeProcessState(const ProcessState& state);

/// The message in `payload`: "v" and "state" are required, "pid" and
/// "since" optional, unknown members ignored. Anything malformed throws
/// ProtocolError.
ProcessState DecodeProcessState(std::string_view payload);

/// The Last Will that marks the process as failed: {"state":"failed","v":1}.
std::string LastWillPayload();

} // namespace qv::network::protocol
