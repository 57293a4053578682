// The value message.

#include "network/protocol/ValueMessage.h"

#include "network/protocol/JsonFields.h"
#include "network/protocol/VarDataJson.h"

#include <limits>

namespace qv::network::protocol {

using namespace detail;

std::string EncodeValueMessage(const ValueMessage& message)
{
    Json json = NewMessage();
    json["value"] = VarDataToJson(message.value);
    json["quality"] = QualityJson(message.quality);
    json["error"] = message.error;
    json["time"] = TimeJson(message.time);
    return Dump(json);
}

ValueMessage DecodeValueMessage(std::string_view payload)
{
    const Json json = ParseMessage(payload);
    CheckVersion(json);
    ValueMessage message;
    message.value = VarDataFromJson(Required(json, "value"));
    if (const Json* quality = Member(json, "quality"))
        message.quality = AsQuality(*quality, "quality");
    if (const Json* error = Member(json, "error"))
        message.error = static_cast<std::int32_t>(AsInteger(*error, std::numeric_limits<std::int32_t>::min(),
                                                            std::numeric_limits<std::int32_t>::max(), "error"));
    if (const Json* time = Member(json, "time"))
        message.time = AsTime(*time, "time");
    return message;
}

} // namespace qv::network::protocol
