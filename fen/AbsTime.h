#pragma once
/// \file
/// Absolute time: a 128-bit signed fixed-point count of seconds since
/// 1904-01-01 00:00:00 UTC, and its conversion to counts of other units
/// since other epochs.

#include <compare>
#include <cstdint>
#include <limits>

namespace qv::fen {

/// An absolute time with a resolution of 2^-64 second.
///
/// The two halves form one signed 128-bit number of seconds: `seconds` is the
/// high half and `fraction` the low half, so a time before 1904 has negative
/// `seconds` and a non-negative `fraction` (-0.25 s is seconds -1, fraction
/// 0.75 * 2^64). The earliest time stands for "no time".
struct AbsTime {
    /// Fraction of the second, in units of 2^-64 second.
    std::uint64_t fraction;
    /// Whole seconds since 1904-01-01 00:00:00 UTC.
    std::int64_t seconds;

    /// The earliest time (seconds -2^63, fraction 0), which means "no time".
    static constexpr AbsTime Earliest() noexcept { return {0, std::numeric_limits<std::int64_t>::min()}; }
    constexpr bool IsEarliest() const noexcept { return *this == Earliest(); }

    friend constexpr bool operator==(const AbsTime&, const AbsTime&) noexcept = default;
    friend constexpr std::strong_ordering operator<=>(const AbsTime& a, const AbsTime& b) noexcept
    {
        if (auto c = a.seconds <=> b.seconds; c != 0)
            return c;
        return a.fraction <=> b.fraction;
    }

    /// 128-bit addition and subtraction with carry between the halves; a
    /// result beyond the range wraps around as two's complement does.
    AbsTime& operator+=(const AbsTime& other) noexcept;
    AbsTime& operator-=(const AbsTime& other) noexcept;
    friend AbsTime operator+(AbsTime a, const AbsTime& b) noexcept { return a += b; }
    friend AbsTime operator-(AbsTime a, const AbsTime& b) noexcept { return a -= b; }
};

static_assert(sizeof(AbsTime) == 16);

/// Seconds from 1601-01-01 (the file-time epoch) to 1904-01-01.
inline constexpr std::int64_t kFileTimeEpochOffset = 9561628800;
/// Seconds from 1904-01-01 to 1970-01-01 (the C runtime's epoch).
inline constexpr std::int64_t kUnixEpochOffset = 2082844800;

/// Units that a time converts to.
enum class TimeUnit : std::int32_t {
    Attoseconds,          ///< 10^-18 s
    Femtoseconds,         ///< 10^-15 s
    Picoseconds,          ///< 10^-12 s
    Nanoseconds,          ///< 10^-9 s
    HundredNanoseconds,   ///< 10^-7 s, the file-time tick
    Microseconds,
    Milliseconds,
    Seconds,
    Minutes,
    Hours,
    Days,
};

/// How a conversion drops what is finer than its unit.
enum class Rounding {
    /// To the nearest count; a tie goes to the even count.
    NearestEven,
    /// To the count at or before the time (toward the past, also before the
    /// epoch, so a time always lies within the unit it converts to).
    Truncate,
};

/// Conversion statuses.
inline constexpr std::int32_t kTimeOk = 0;
inline constexpr std::int32_t kTimeUnknownUnit = -50003;
inline constexpr std::int32_t kTimeOverflow = -50175;

/// The number of `unit`s from an epoch to `time`.
///
/// `epochOffset` is the number of seconds from that epoch to 1904-01-01
/// (kFileTimeEpochOffset, -kUnixEpochOffset, or 0 for the time's own epoch).
/// The arithmetic is exact. Returns kTimeOk and sets `count`, or returns
/// kTimeUnknownUnit or kTimeOverflow (the count does not fit 64 bits) and
/// leaves `count` unchanged.
std::int32_t AbsTimeToCount(const AbsTime& time, std::int64_t epochOffset, TimeUnit unit, Rounding rounding,
                            std::int64_t& count) noexcept;

/// File-time ticks: 100 ns since 1601-01-01 UTC.
std::int32_t AbsTimeToFileTime(const AbsTime& time, Rounding rounding, std::int64_t& ticks) noexcept;

/// C-runtime seconds: seconds since 1970-01-01 UTC.
std::int32_t AbsTimeToUnixSeconds(const AbsTime& time, Rounding rounding, std::int64_t& seconds) noexcept;

/// The time `seconds` + `fraction` * 2^-64 after 1970-01-01 UTC; a time
/// beyond the range of AbsTime throws OutOfRange.
AbsTime AbsTimeFromUnixSeconds(std::int64_t seconds, std::uint64_t fraction = 0);

/// `part` / `whole` of a second as a fraction in 2^-64 s, rounded to nearest
/// (FractionOfSecond(1, 4) is 2^62). `part` must be below `whole`, otherwise
/// InvalidArgument is thrown.
std::uint64_t FractionOfSecond(std::uint64_t part, std::uint64_t whole);

} // namespace qv::fen
