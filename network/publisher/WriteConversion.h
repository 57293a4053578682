#pragma once
/// \file
/// How a written value is made to suit the variable it is written to.

#include "value/VarData.h"

#include <cstdint>
#include <string>

namespace qv::network::publisher {

/// Converts `written` to a value of the variable's type code `type` and, for
/// Numeric, numeric kind `kind`, into `result`. Returns false, with the
/// reason in `why`, when the value does not suit the variable:
///
/// - a value of the variable's own type is taken as it is; a Numeric one
///   takes the variable's kind and must fit it (integer kinds and the bit
///   field: a whole number in range; 32-bit float: within float range, then
///   rounded to float precision);
/// - Numeric variables also take logicals, UInt64 counts that a double holds
///   exactly and text that reads wholly as a number;
/// - Logical variables take numbers (not NaN) and the texts true, false, on,
///   off, yes, no or a number;
/// - UInt64 variables take whole non-negative numbers below 2^64 and decimal text;
/// - ANSI and Unicode text variables take text, logicals, numbers and counts,
///   written as the value model writes them;
/// - nothing else converts.
bool ConvertForWrite(const value::VarData& written, std::uint16_t type, std::uint8_t kind, value::VarData& result,
                     std::string& why);

} // namespace qv::network::publisher
