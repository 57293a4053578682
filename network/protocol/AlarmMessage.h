#pragma once
/// \file
/// The state of one alarm, retained on "orvek/v1/<process>/alarm/<alarm id>".
///
///     {"v":1, "state":"raised", "acknowledged":false, "text":"Drum level high",
///      "severity":700, "time":{"s":"...","f":"..."}, "user":""}
///
/// An alarm is raised or cleared, and separately acknowledged or not: a
/// cleared alarm that nobody has acknowledged stays listed. The owning
/// process publishes a new message on every change (raising resets the
/// acknowledgement) and removes an alarm that is both cleared and
/// acknowledged, if it wants to, with an empty retained message, which is no
/// alarm message and is not given to the decoder.

#include "fen/AbsTime.h"

#include <cstdint>
#include <string>
#include <string_view>

namespace qv::network::protocol {

struct AlarmMessage {
    /// True while the condition holds ("raised"), false once it has ended ("cleared").
    bool raised = true;
    bool acknowledged = false;
    std::string text;
    /// 0 to 1000; larger is more severe.
    std::uint16_t severity = 0;
    /// When the alarm last changed; the earliest time means no time.
    fen::AbsTime time = fen::AbsTime::Earliest();
    /// Who acknowledged it; empty when not acknowledged or unknown.
    std::string user;
};

/// The message as UTF-8 JSON; a severity above 1000 or text that is not
/// valid UTF-8 throws InvalidArgument.
std::string EncodeAlarmMessage(const AlarmMessage& alarm);

/// The alarm in `payload`: "v" and "state" required, the rest optional
/// (not acknowledged, empty text, severity 0, no time, no user), unknown
/// members ignored. Anything malformed throws ProtocolError.
AlarmMessage DecodeAlarmMessage(std::string_view payload);

} // namespace qv::network::protocol
