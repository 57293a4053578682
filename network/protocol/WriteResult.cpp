// The answer to a write request.

#include "network/protocol/WriteResult.h"

#include "network/protocol/JsonFields.h"

#include <limits>

namespace qv::network::protocol {

using namespace detail;

std::string EncodeWriteResult(const WriteResult& result)
{
    Json json = NewMessage();
    json["id"] = result.id;
    json["status"] = result.status;
    json["text"] = result.text;
    return Dump(json);
}

WriteResult DecodeWriteResult(std::string_view payload)
{
    const Json json = ParseMessage(payload);
    CheckVersion(json);
    WriteResult result;
    result.id = AsString(Required(json, "id"), "id");
    result.status = static_cast<std::int32_t>(AsInteger(Required(json, "status"),
                                                        std::numeric_limits<std::int32_t>::min(),
                                                        std::numeric_limits<std::int32_t>::max(), "status"));
    if (const Json* text = Member(json, "text"))
        result.text = AsString(*text, "text");
    return result;
}

} // namespace qv::network::protocol
