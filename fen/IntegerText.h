#pragma once
/// \file
/// Unsigned integers as text in any radix from 2 to 36, and fixed-width hex.

#include "fen/String.h"

#include <cstdint>

namespace qv::fen {

/// Digits of `value` in `radix` (2 to 36, upper-case letters), no sign ever;
/// another radix throws UnableToConvert.
WString IntegerToString(std::uint32_t value, std::uint32_t radix);
WString IntegerToString(std::uint64_t value, std::uint32_t radix);

/// "0x" and the value's upper-case hex digits, zero-padded to 8 digits.
String HexText(std::uint32_t value);
/// "0x" and the value's upper-case hex digits, zero-padded to 16 digits.
String HexText(std::uint64_t value);
WString WideHexText(std::uint32_t value);
WString WideHexText(std::uint64_t value);

} // namespace qv::fen
