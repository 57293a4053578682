// The state of one alarm.

#include "network/protocol/AlarmMessage.h"

#include "fen/Exception.h"
#include "network/protocol/JsonFields.h"
#include "network/protocol/ProtocolError.h"

namespace qv::network::protocol {

using namespace detail;

namespace {
constexpr std::int64_t kMaxSeverity = 1000;
}

std::string EncodeAlarmMessage(const AlarmMessage& alarm)
{
    if (alarm.severity > kMaxSeverity)
        QV_THROW(fen::exception::InvalidArgument());
    Json json = NewMessage();
    json["state"] = alarm.raised ? "raised" : "cleared";
    json["acknowledged"] = alarm.acknowledged;
    json["text"] = alarm.text;
    json["severity"] = alarm.severity;
    json["time"] = TimeJson(alarm.time);
    json["user"] = alarm.user;
    return Dump(json);
}

AlarmMessage DecodeAlarmMessage(std::string_view payload)
{
    const Json json = ParseMessage(payload);
    CheckVersion(json);
    AlarmMessage alarm;
    const std::string& state = AsString(Required(json, "state"), "state");
    if (state != "raised" && state != "cleared")
        throw ProtocolError("unknown alarm state \"" + state + "\"");
    alarm.raised = state == "raised";
    if (const Json* acknowledged = Member(json, "acknowledged"))
        alarm.acknowledged = AsBool(*acknowledged, "acknowledged");
    if (const Json* text = Member(json, "text"))
        alarm.text = AsString(*text, "text");
    if (const Json* severity = Member(json, "severity"))
        alarm.severity = static_cast<std::uint16_t>(AsInteger(*severity, 0, kMaxSeverity, "severity"));
    if (const Json* time = Member(json, "time"))
        alarm.time = AsTime(*time, "time");
    if (const Json* user = Member(json, "user"))
        alarm.user = AsString(*user, "user");
    return alarm;
}

} // namespace qv::network::protocol
