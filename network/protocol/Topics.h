#pragma once
/// \file
/// The MQTT topics of the Orvek network and the escaping of the names that
/// go into them.
///
/// Every topic lies below the versioned root "orvek/v1". Each host runs its
/// own broker, so a topic names a process and what it publishes, never the
/// host:
///
///     orvek/v1/<process>/state                 retained process state
///     orvek/v1/<process>/catalogue             retained list of variables and alarms
///     orvek/v1/<process>/value/<path>          retained latest value of a variable
///     orvek/v1/<process>/write/<path>          write request to the owning process
///     orvek/v1/<process>/write-result/<path>   the process's answer to a write
///     orvek/v1/<process>/alarm/<alarm id>      retained state of an alarm
///     orvek/v1/<process>/alarm-ack/<alarm id>  acknowledge request
///
/// <process>, <path> and <alarm id> are escaped names (EscapeTopicLevel), so
/// each is exactly one topic level whatever characters the name holds.
/// Names are case-sensitive on the wire.

#include "fen/OrvekURL.h"

#include <string>
#include <string_view>

namespace qv::network::protocol {

/// The root of every topic; its last level is the protocol's major version.
inline constexpr std::string_view kTopicRoot = "orvek/v1";

/// What a topic carries; the text of each is its topic level.
enum class TopicKind {
    State,       ///< "state"
    Catalogue,   ///< "catalogue"
    Value,       ///< "value"
    Write,       ///< "write"
    WriteResult, ///< "write-result"
    Alarm,       ///< "alarm"
    AlarmAck,    ///< "alarm-ack"
};

/// The topic level of `kind`.
std::string_view TopicKindName(TopicKind kind) noexcept;

/// True for the kinds whose topic ends in a variable path or an alarm id.
bool TopicKindHasName(TopicKind kind) noexcept;

/// One topic level that stands for `name` (any bytes, normally UTF-8).
///
/// A-Z, a-z, 0-9, '.', '_', '~' and '-' stand for themselves; every other
/// byte is written as '%' and two upper-case hexadecimal digits. The empty
/// name is the single character "%", which no non-empty name produces. The
/// escaping is injective and the result holds no MQTT wildcard, no '/' and
/// nothing but printable ASCII.
std::string EscapeTopicLevel(std::string_view name);

/// The name that EscapeTopicLevel turned into `level`. Only that exact form
/// is accepted, so each name has one level and each level one name: a '%'
/// must be followed by two upper-case hexadecimal digits that do not stand
/// for a byte written as itself, and only the bytes listed above may appear
/// unescaped. Anything else throws ProtocolError.
std::string UnescapeTopicLevel(std::string_view level);

/// "orvek/v1/<process>/<kind>" for the per-process kinds State and Catalogue.
/// `process` is the unescaped name.
std::string ProcessTopic(std::string_view process, TopicKind kind);

/// "orvek/v1/<process>/<kind>/<name>" for the kinds that carry a name;
/// `process` and `name` are unescaped.
std::string NamedTopic(std::string_view process, TopicKind kind, std::string_view name);

/// "orvek/v1/<process>/<kind>/+": the filter that matches every topic of
/// `kind` of one process (a name is always exactly one level).
std::string NamedTopicFilter(std::string_view process, TopicKind kind);

/// A topic taken apart; `process` and `name` are unescaped.
struct ParsedTopic {
    std::string process;
    TopicKind kind;
    /// The variable path or alarm id; empty for State and Catalogue.
    std::string name;
};

/// Takes a topic of this protocol apart; a topic outside the root, of an
/// unknown kind, with a missing or surplus level or a badly escaped name
/// throws ProtocolError.
ParsedTopic ParseTopic(std::string_view topic);

/// The process of an item URL, as UTF-8: the name of the segment after the
/// host (host form) or the first segment (local form). A URL of another
/// form, or without a process, throws InvalidArgument.
std::string ProcessName(const fen::OrvekURL& url);

/// The path of a variable inside its process, as UTF-8: the segments after
/// the process, printed as the URL printer prints them ("drum.level",
/// "a\'x.y'"). Different texts of one URL (quoting, a trailing backslash,
/// local or host form) give the same path. A URL without a path, or whose
/// path steps to a parent (".."), throws InvalidArgument. Lone surrogates of
/// a name are kept as by Utf8FromUtf16.
std::string VariablePath(const fen::OrvekURL& url);

/// The value topic of the variable `url` names.
std::string ValueTopic(const fen::OrvekURL& url);

/// The printed form of `path` (UTF-8) as VariablePath gives it: `path` is
/// read as the path part of an item URL and printed again. A text that is
/// no valid path throws ProtocolError. A path equal to its printed form is
/// the one text under which its variable is published.
std::string CanonicalVariablePath(std::string_view path);

} // namespace qv::network::protocol
