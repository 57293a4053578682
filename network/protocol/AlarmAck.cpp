// The request to acknowledge an alarm.

#include "network/protocol/AlarmAck.h"

#include "network/protocol/JsonFields.h"

namespace qv::network::protocol {

using namespace detail;

std::string EncodeAlarmAck(const AlarmAck& ack)
{
    Json json = NewMessage();
    json["user"] = ack.user;
    json["comment"] = ack.comment;
    return Dump(json);
}

AlarmAck DecodeAlarmAck(std::string_view payload)
{
    const Json json = ParseMessage(payload);
    CheckVersion(json);
    AlarmAck ack;
    if (const Json* user = Member(json, "user"))
        ack.user = AsString(*user, "user");
    if (const Json* comment = Member(json, "comment"))
        ack.comment = AsString(*comment, "comment");
    return ack;
}

} // namespace qv::network::protocol
