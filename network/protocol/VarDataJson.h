#pragma once
/// \file
/// A VarData as JSON, losslessly: every type code with its sub-type, exact
/// doubles, 64-bit counts, bytes, nested vectors and dictionaries, full
/// times and wrapped values.
///
/// The form is an object {"t": type word, ...} with at most one content
/// member chosen by the type code (docs/protocol.md lists them):
/// "b" Logical, "n" Numeric, "u" Time and UInt64, "w" code 13,
/// "a" or "a64" AnsiString, "u16" or "u16w" UnicodeString, "r" RawBytes,
/// "e" Vector, "d" Dictionary, "s" and "f" the two time codes,
/// "fd" and "fx" FBVariant, "x" FlexData. Codes without a payload, unknown
/// codes and storage codes without storage have no content member.

#include "value/VarData.h"

#include <nlohmann/json_fwd.hpp>

namespace qv::network::protocol {

/// How deep values nest, the outermost counting as 1; each vector element,
/// dictionary key or value and wrapped value is one level below its holder.
inline constexpr int kMaxValueDepth = 64;

/// The JSON of `value`. A value nested deeper than kMaxValueDepth throws
/// InvalidArgument, as does storage whose contents cannot be read.
nlohmann::json VarDataToJson(const value::VarData& value);

/// The value that `json` describes. Decoding is strict and total: a member
/// of the wrong JSON type or absent where needed, a member that the type
/// code does not have, a number out of range, bad base64, malformed text,
/// a repeated dictionary key or nesting beyond kMaxValueDepth throws
/// ProtocolError, and no value comes out. Empty text, bytes or elements
/// give the value without storage, which means the same.
value::VarData VarDataFromJson(const nlohmann::json& json);

} // namespace qv::network::protocol
