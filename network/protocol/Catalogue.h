#pragma once
/// \file
/// The catalogue message, retained on "orvek/v1/<process>/catalogue": the
/// variables and alarms of one process.
///
///     {"v":1,
///      "variables":[{"path":"drum.level","type":3,"kind":0,"access":3,"valued":true}],
///      "alarms":[{"id":"drum-high","text":"Drum level high","severity":700,
///                 "path":"drum.level"}]}
///
/// A process publishes it whenever its set of variables or alarms changes
/// and when a variable gets its first value; the latest one is the whole truth.

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace qv::network::protocol {

/// Access bits of a variable.
namespace Access {
inline constexpr std::uint32_t Read = 0x1;
inline constexpr std::uint32_t Write = 0x2;
} // namespace Access

struct CatalogueVariable {
    /// The path inside the process in its printed form (CanonicalVariablePath), UTF-8.
    std::string path;
    /// The type code (low 16 bits of the type word) the variable's values have.
    std::uint16_t type = 0;
    /// The numeric kind, 0 to 15; meaningful for Numeric variables.
    std::uint8_t kind = 0;
    /// Access bits; bits other than Read and Write travel unchanged.
    std::uint32_t access = Access::Read;
    /// Whether the process has published a value for the variable, which its
    /// value topic then retains. A subscriber that is given no value for a
    /// valued variable knows the value was withheld from it.
    bool valued = false;
};

struct CatalogueAlarm {
    /// The alarm's id within the process, not empty; names its alarm topic.
    std::string id;
    std::string text;
    /// 0 to 1000; larger is more severe.
    std::uint16_t severity = 0;
    /// The path of the variable the alarm watches, or empty.
    std::string path;
};

struct Catalogue {
    std::vector<CatalogueVariable> variables;
    std::vector<CatalogueAlarm> alarms;
};

/// The message as UTF-8 JSON. A path that is not in its printed form, a
/// repeated path or alarm id, an empty alarm id, a kind above 15, a
/// severity above 1000 or text that is not valid UTF-8 throws InvalidArgument.
std::string EncodeCatalogue(const Catalogue& catalogue);

/// The catalogue in `payload`. "v" and "variables" are required, "alarms"
/// optional; in a variable "path" and "type" are required, "kind" (0),
/// "access" (read only) and "valued" (false) optional; in an alarm "id" is
/// required, "text", "severity" and "path" optional. Unknown members are ignored. Whatever
/// EncodeCatalogue would refuse, and anything malformed, throws ProtocolError.
Catalogue DecodeCatalogue(std::string_view payload);

} // namespace qv::network::protocol
