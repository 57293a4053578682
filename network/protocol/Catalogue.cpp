// The catalogue message.

#include "network/protocol/Catalogue.h"

#include "fen/Exception.h"
#include "network/protocol/JsonFields.h"
#include "network/protocol/ProtocolError.h"
#include "network/protocol/Topics.h"

#include <limits>
#include <set>

namespace qv::network::protocol {

using namespace detail;

namespace {

constexpr std::int64_t kMaxKind = 15;
constexpr std::int64_t kMaxSeverity = 1000;

void CheckPath(const std::string& path)
{
    if (CanonicalVariablePath(path) != path)
        throw ProtocolError("variable path \"" + path + "\" is not in its printed form");
}

/// The rules that both directions hold the catalogue to.
void Validate(const Catalogue& catalogue)
{
    std::set<std::string_view> paths;
    for (const CatalogueVariable& variable : catalogue.variables) {
        CheckPath(variable.path);
        if (!paths.insert(variable.path).second)
            throw ProtocolError("variable \"" + variable.path + "\" listed twice");
        if (variable.kind > kMaxKind)
            throw ProtocolError("numeric kind above 15");
    }
    std::set<std::string_view> ids;
    for (const CatalogueAlarm& alarm : catalogue.alarms) {
        if (alarm.id.empty())
            throw ProtocolError("alarm without an id");
        if (!ids.insert(alarm.id).second)
            throw ProtocolError("alarm \"" + alarm.id + "\" listed twice");
        if (!alarm.path.empty())
            CheckPath(alarm.path);
        if (alarm.severity > kMaxSeverity)
            throw ProtocolError("alarm severity above 1000");
    }
}

CatalogueVariable DecodeVariable(const Json& json)
{
    AsObject(json, "variables");
    CatalogueVariable variable;
    variable.path = AsString(Required(json, "path"), "path");
    variable.type = static_cast<std::uint16_t>(AsInteger(Required(json, "type"), 0, 0xFFFF, "type"));
    if (const Json* kind = Member(json, "kind"))
        variable.kind = static_cast<std::uint8_t>(AsInteger(*kind, 0, kMaxKind, "kind"));
    if (const Json* access = Member(json, "access"))
        variable.access =
            static_cast<std::uint32_t>(AsInteger(*access, 0, std::numeric_limits<std::uint32_t>::max(), "access"));
    if (const Json* valued = Member(json, "valued"))
        variable.valued = AsBool(*valued, "valued");
    return variable;
}

CatalogueAlarm DecodeAlarm(const Json& json)
{
    AsObject(json, "alarms");
    CatalogueAlarm alarm;
    alarm.id = AsString(Required(json, "id"), "id");
    if (const Json* text = Member(json, "text"))
        alarm.text = AsString(*text, "text");
    if (const Json* severity = Member(json, "severity"))
        alarm.severity = static_cast<std::uint16_t>(AsInteger(*severity, 0, kMaxSeverity, "severity"));
    if (const Json* path = Member(json, "path"))
        alarm.path = AsString(*path, "path");
    return alarm;
}

} // namespace

std::string EncodeCatalogue(const Catalogue& catalogue)
{
    try {
        Validate(catalogue);
    } catch (const ProtocolError&) {
        QV_THROW(fen::exception::InvalidArgument());
    }
    Json variables = Json::array();
    for (const CatalogueVariable& variable : catalogue.variables)
        variables.push_back({{"path", variable.path},
                             {"type", variable.type},
                             {"kind", variable.kind},
                             {"access", variable.access},
                             {"valued", variable.valued}});
    Json alarms = Json::array();
    for (const CatalogueAlarm& alarm : catalogue.alarms) {
        Json entry{{"id", alarm.id}, {"text", alarm.text}, {"severity", alarm.severity}};
        if (!alarm.path.empty())
            entry["path"] = alarm.path;
        alarms.push_back(std::move(entry));
    }
    Json json = NewMessage();
    json["variables"] = std::move(variables);
    json["alarms"] = std::move(alarms);
    return Dump(json);
}

Catalogue DecodeCatalogue(std::string_view payload)
{
    const Json json = ParseMessage(payload);
    CheckVersion(json);
    Catalogue catalogue;
    for (const Json& variable : AsArray(Required(json, "variables"), "variables"))
        catalogue.variables.push_back(DecodeVariable(variable));
    if (const Json* alarms = Member(json, "alarms"))
        for (const Json& alarm : AsArray(*alarms, "alarms"))
            catalogue.alarms.push_back(DecodeAlarm(alarm));
    Validate(catalogue);
    return catalogue;
}

} // namespace qv::network::protocol
