#pragma once
/// \file
/// The write request, sent (not retained) to "orvek/v1/<process>/write/<path>".
///
///     {"v":1, "id":"monitor-4711-1", "user":"operator", "value":{"t":3,"n":42}}
///
/// Only the owning process acts on it: it checks the variable's access and
/// the user, stores the value (publishing the new value message) and
/// answers every request it can read with a WriteResult carrying the same id.

#include "value/VarData.h"

#include <string>
#include <string_view>

namespace qv::network::protocol {

struct WriteRequest {
    /// Chosen by the requester, unique among its requests, not empty;
    /// the answer carries it back.
    std::string id;
    /// The user the requester is logged in as; empty without a login.
    std::string user;
    value::VarData value;
};

/// The message as UTF-8 JSON; an empty id, text that is not valid UTF-8 or
/// a value VarDataToJson refuses throws InvalidArgument.
std::string EncodeWriteRequest(const WriteRequest& request);

/// The request in `payload`: "v", "id" (not empty) and "value" required,
/// "user" optional, unknown members ignored. Anything malformed throws
/// ProtocolError.
WriteRequest DecodeWriteRequest(std::string_view payload);

} // namespace qv::network::protocol
