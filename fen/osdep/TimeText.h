#pragma once
/// \file
/// An absolute time as display text, through wcsftime formats.

#include "fen/AbsTime.h"
#include "fen/String.h"

#include <cstdint>

namespace qv::fen::osdep {

/// Values of AbsTimeToString's `zone`.
inline constexpr std::int32_t kShowUtc = 0;
/// Local time through the C runtime; where it cannot convert the time, the
/// file-time conversion is used. Any value other than 0 and 2 acts as this.
inline constexpr std::int32_t kShowLocalTime = 1;
/// Local time through the file-time conversion.
inline constexpr std::int32_t kShowFileTimeLocal = 2;

/// Values of AbsTimeToString's `decimalSeparator`; any other value means
/// the locale's separator.
inline constexpr std::int32_t kLocaleSeparator = 0;
inline constexpr std::int32_t kFullStopSeparator = 1;
inline constexpr std::int32_t kCommaSeparator = 2;

/// The text of `time`: its date and time of day formatted by wcsftime.
///
/// \param dateFormat  wcsftime format of the date; null for the locale's
///                    short date format, empty for no date.
/// \param timeFormat  wcsftime format of the time of day; null for the
///                    locale's time format, empty for no time of day. "%#d"
///                    and the like drop leading zeros.
/// \param fractionDigits  digits of the fraction of a second (0 to 6),
///                    shown after every "%S" and "%#S" of the time format
///                    behind the decimal separator, rounded half up. A
///                    fraction that rounds up to a whole second shows the
///                    next second with zero digits.
/// \param zone        kShowUtc, kShowLocalTime or kShowFileTimeLocal. Without
///                    fraction digits kShowLocalTime rounds the time to the
///                    nearest second, the others drop the part below the
///                    second.
/// \param timeFirst   puts the time of day before the date.
/// \param suffix      appended to a non-empty time format after a space; may
///                    be null.
/// \param decimalSeparator  kFullStopSeparator, kCommaSeparator, or any
///                    other value for the locale's separator.
///
/// The date and the time of day are joined by one space when both are
/// present. The earliest time ("no time") gives the empty text, and so does
/// a text longer than 511 characters.
///
/// Throws InvalidArgument for more than 6 digits (before anything else),
/// OutOfRange for a time the conversions cannot show (before 1601 or after
/// the year 9999), WinError when a locale value cannot be read.
WString AbsTimeToString(const AbsTime& time, const char16_t* dateFormat, const char16_t* timeFormat,
                        std::uint32_t fractionDigits, std::int32_t zone, bool timeFirst, const char16_t* suffix,
                        std::int32_t decimalSeparator);

} // namespace qv::fen::osdep
