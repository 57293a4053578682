#pragma once
/// \file
/// The request to acknowledge an alarm, sent (not retained) to
/// "orvek/v1/<process>/alarm-ack/<alarm id>".
///
///     {"v":1, "user":"operator", "comment":"valve checked"}
///
/// The owning process answers by publishing the alarm's new state with
/// "acknowledged" set; a request for an unknown alarm, or from a user who may
/// not acknowledge it, changes nothing.

#include <string>
#include <string_view>

namespace qv::network::protocol {

struct AlarmAck {
    /// The user the requester is logged in as; empty without a login.
    std::string user;
    std::string comment;
};

/// The message as UTF-8 JSON; text that is not valid UTF-8 throws InvalidArgument.
std::string EncodeAlarmAck(const AlarmAck& ack);

/// The request in `payload`: "v" required, "user" and "comment" optional,
/// unknown members ignored. Anything malformed throws ProtocolError.
AlarmAck DecodeAlarmAck(std::string_view payload);

} // namespace qv::network::protocol
