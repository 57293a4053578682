#pragma once
/// \file
/// How stored text reads as a number and as a logical.
///
/// A text that is a decimal number, with optional surrounding blanks, reads
/// as that number ("12.5" is 12.5, "-3e2" is -300); any other text reads as
/// 0. A text reads as true when it is "true", "on" or "yes" in any letter
/// case, or a number other than 0; otherwise false.

#include <string_view>

namespace qv::value::dynamic {

double TextToDouble(std::string_view text) noexcept;
bool TextToBool(std::string_view text) noexcept;
double TextToDouble(std::u16string_view text) noexcept;
bool TextToBool(std::u16string_view text) noexcept;

} // namespace qv::value::dynamic
