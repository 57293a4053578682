#pragma once
/// \file
/// The value message: what a process publishes, retained, on the value topic
/// of a variable each time the variable's value, quality, error or time
/// changes.
///
///     {"v":1, "value":{...}, "quality":"0x0000000000000000", "error":0,
///      "time":{"s":"3786825600","f":"0"}}
///
/// The message carries no change mask: a subscriber finds what changed by
/// comparing with the message before. An empty retained message on a value
/// topic means the variable no longer exists; it is no value message and is
/// not given to the decoder.

#include "fen/AbsTime.h"
#include "value/VarData.h"

#include <cstdint>
#include <string>
#include <string_view>

namespace qv::network::protocol {

struct ValueMessage {
    value::VarData value;
    /// The quality word; 0 is good.
    std::uint64_t quality = 0;
    /// The variable's error code; negative means an error.
    std::int32_t error = 0;
    /// When the value was taken; the earliest time means no time.
    fen::AbsTime time = fen::AbsTime::Earliest();
};

/// The message as UTF-8 JSON. Throws InvalidArgument for a value that
/// VarDataToJson refuses.
std::string EncodeValueMessage(const ValueMessage& message);

/// The message that `payload` holds. "v" and "value" are required;
/// "quality", "error" and "time" may be left out and then are 0, 0 and no
/// time; members this version does not know are ignored. Anything malformed
/// throws ProtocolError.
ValueMessage DecodeValueMessage(std::string_view payload);

} // namespace qv::network::protocol
