#pragma once
/// \file
/// Texts of the 64-bit quality word that comes with every value.
///
/// The word is passed as its two 32-bit halves. A word of 0 is "good"; each
/// set bit is one condition with a lower-case text. Low bits 0-30 and high
/// bits 0-4 have texts; low bit 31 and high bits 5-31 have none and add
/// nothing to any text.

#include "fen/String.h"

#include <cstdint>
#include <string_view>

namespace qv::value {

/// Text of a word with at most one bit set: "good" for 0; otherwise the low
/// half's text (empty unless the low half is exactly one bit with a text)
/// directly followed, without separator, by the texts of the high bits 0-4
/// that are set, in bit order.
fen::String QualityFlagText(std::uint32_t low, std::uint32_t high);

/// Text of a whole word: "good" for 0; otherwise the texts of its set bits,
/// low bits first, each in increasing bit order, with `separator` between
/// two texts. A word whose only set bits have no text gives the empty text.
fen::String QualityText(std::uint32_t low, std::uint32_t high, std::string_view separator);

} // namespace qv::value
