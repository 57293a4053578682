#pragma once
/// \file
/// The General number format: the one number-to-text rule of value texts.

#include <cstddef>

namespace qv::value {

/// Writes `value` as "%G" prints it (six significant digits, trailing zeros
/// and point removed, exponent form "1E+06" below 1E-04 and from 1E+06 on)
/// but always with a full stop, whatever the locale, and returns the text's
/// length. Text that does not fit with its NUL is replaced by min(size, 16)
/// - 1 asterisks, whose count is returned. A null buffer or size 0 writes
/// nothing and returns 0.
std::size_t FormatGeneral(double value, char* buffer, std::size_t size) noexcept;

} // namespace qv::value
