// The write request.

#include "network/protocol/WriteRequest.h"

#include "fen/Exception.h"
#include "network/protocol/JsonFields.h"
#include "network/protocol/ProtocolError.h"
#include "network/protocol/VarDataJson.h"

namespace qv::network::protocol {

using namespace detail;

std::string EncodeWriteRequest(const WriteRequest& request)
{
    if (request.id.empty())
        QV_THROW(fen::exception::InvalidArgument());
    Json json = NewMessage();
    json["id"] = request.id;
    json["user"] = request.user;
    json["value"] = VarDataToJson(request.value);
    return Dump(json);
}

WriteRequest DecodeWriteRequest(std::string_view payload)
{
    const Json json = ParseMessage(payload);
    CheckVersion(json);
    WriteRequest request;
    request.id = AsString(Required(json, "id"), "id");
    if (request.id.empty())
        throw ProtocolError("write request with an empty id");
    if (const Json* user = Member(json, "user"))
        request.user = AsString(*user, "user");
    request.value = VarDataFromJson(Required(json, "value"));
    return request;
}

} // namespace qv::network::protocol
