#pragma once
/// \file
/// Strict reading and writing of the JSON that the messages share: parsing
/// with limits, typed members, 64-bit numbers as decimal text, the time, the
/// quality word and the message version. Every reading failure is a
/// ProtocolError that names the member at fault.

#include "fen/AbsTime.h"

#include <nlohmann/json.hpp>

#include <cstdint>
#include <string>
#include <string_view>

namespace qv::network::protocol::detail {

using Json = nlohmann::json;

/// The version that every message of this protocol carries in "v".
inline constexpr std::int64_t kMessageVersion = 1;

/// Parses `payload` as one JSON object. Malformed JSON, invalid UTF-8, a
/// member name repeated in one object, nesting deeper than the protocol
/// ever needs, or a top level that is not an object throw ProtocolError.
Json ParseMessage(std::string_view payload);

/// Checks that "v" of `message` is kMessageVersion.
void CheckVersion(const Json& message);

/// A message object holding only "v".
Json NewMessage();

/// Compact text of `message`; a string that is not valid UTF-8 throws
/// InvalidArgument (an encoder's caller gave bad text).
std::string Dump(const Json& message);

/// The member `name` of `object`, or null when it is absent.
const Json* Member(const Json& object, std::string_view name);
/// The member `name` of `object`; an absent one throws ProtocolError.
const Json& Required(const Json& object, std::string_view name);

// Typed readings; `what` names the member in the error text.
const Json& AsObject(const Json& value, std::string_view what);
const Json& AsArray(const Json& value, std::string_view what);
const std::string& AsString(const Json& value, std::string_view what);
bool AsBool(const Json& value, std::string_view what);
/// A JSON integer (no fraction, no exponent) from `least` to `most`.
std::int64_t AsInteger(const Json& value, std::int64_t least, std::int64_t most, std::string_view what);

/// Decimal text of a 64-bit number: digits, a leading '-' for the signed
/// form, no sign on zero, no leading zeros.
Json UnsignedText(std::uint64_t number);
Json SignedText(std::int64_t number);
std::uint64_t AsUnsignedText(const Json& value, std::string_view what);
std::int64_t AsSignedText(const Json& value, std::string_view what);

/// {"s": seconds as signed text, "f": fraction as unsigned text}.
Json TimeJson(const fen::AbsTime& time);
fen::AbsTime AsTime(const Json& value, std::string_view what);

/// "0x" and 16 upper-case hexadecimal digits; reading takes 1 to 16 digits
/// of either case.
Json QualityJson(std::uint64_t quality);
std::uint64_t AsQuality(const Json& value, std::string_view what);

} // namespace qv::network::protocol::detail
