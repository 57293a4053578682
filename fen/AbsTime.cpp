#include "fen/AbsTime.h"

#include "fen/Exception.h"

namespace qv::fen {
namespace {

using Int128 = __int128;
using UInt128 = unsigned __int128;

constexpr UInt128 kOneSecond = UInt128{1} << 64;

/// A unit as a rational number of units per second: `perSecond` for units
/// shorter than a second, 1 / `secondsPer` for longer ones.
struct UnitScale {
    std::uint64_t perSecond;
    std::uint64_t secondsPer;
};

bool ScaleOf(TimeUnit unit, UnitScale& scale) noexcept
{
    switch (unit) {
    case TimeUnit::Attoseconds: scale = {1'000'000'000'000'000'000, 1}; return true;
    case TimeUnit::Femtoseconds: scale = {1'000'000'000'000'000, 1}; return true;
    case TimeUnit::Picoseconds: scale = {1'000'000'000'000, 1}; return true;
    case TimeUnit::Nanoseconds: scale = {1'000'000'000, 1}; return true;
    case TimeUnit::HundredNanoseconds: scale = {10'000'000, 1}; return true;
    case TimeUnit::Microseconds: scale = {1'000'000, 1}; return true;
    case TimeUnit::Milliseconds: scale = {1'000, 1}; return true;
    case TimeUnit::Seconds: scale = {1, 1}; return true;
    case TimeUnit::Minutes: scale = {1, 60}; return true;
    case TimeUnit::Hours: scale = {1, 3'600}; return true;
    case TimeUnit::Days: scale = {1, 86'400}; return true;
    }
    return false;
}

Int128 FloorDivide(Int128 a, Int128 b) noexcept
{
    Int128 q = a / b;
    if ((a % b != 0) && ((a < 0) != (b < 0)))
        --q;
    return q;
}

} // namespace

AbsTime& AbsTime::operator+=(const AbsTime& other) noexcept
{
    const std::uint64_t low = fraction + other.fraction;
    const std::uint64_t carry = low < fraction ? 1 : 0;
    seconds = static_cast<std::int64_t>(static_cast<std::uint64_t>(seconds) +
                                        static_cast<std::uint64_t>(other.seconds) + carry);
    fraction = low;
    return *this;
}

AbsTime& AbsTime::operator-=(const AbsTime& other) noexcept
{
    const std::uint64_t borrow = fraction < other.fraction ? 1 : 0;
    seconds = static_cast<std::int64_t>(static_cast<std::uint64_t>(seconds) -
                                        static_cast<std::uint64_t>(other.seconds) - borrow);
    fraction -= other.fraction;
    return *this;
}

std::int32_t AbsTimeToCount(const AbsTime& time, std::int64_t epochOffset, TimeUnit unit, Rounding rounding,
                            std::int64_t& count) noexcept
{
    UnitScale scale;
    if (!ScaleOf(unit, scale))
        return kTimeUnknownUnit;

    // Whole seconds since the target epoch; it needs 65 bits at most.
    const Int128 whole = Int128{time.seconds} + epochOffset;

    // The count is `integral` plus `remainder` / `divisor`, with the
    // remainder in [0, divisor): a floor division, whatever the sign.
    Int128 integral;
    UInt128 remainder;
    UInt128 divisor;
    if (scale.secondsPer == 1) {
        const UInt128 scaledFraction = UInt128{time.fraction} * scale.perSecond;
        integral = whole * static_cast<Int128>(scale.perSecond) + static_cast<Int128>(scaledFraction >> 64);
        remainder = scaledFraction & (kOneSecond - 1);
        divisor = kOneSecond;
    } else {
        const Int128 per = scale.secondsPer;
        integral = FloorDivide(whole, per);
        const auto leftSeconds = static_cast<UInt128>(whole - integral * per);
        remainder = (leftSeconds << 64) | time.fraction;
        divisor = static_cast<UInt128>(per) << 64;
    }

    if (rounding == Rounding::NearestEven) {
        const UInt128 half = divisor / 2;
        if (remainder > half || (remainder == half && (integral & 1) != 0))
            ++integral;
    }

    if (integral < std::numeric_limits<std::int64_t>::min() || integral > std::numeric_limits<std::int64_t>::max())
        return kTimeOverflow;
    count = static_cast<std::int64_t>(integral);
    return kTimeOk;
}

std::int32_t AbsTimeToFileTime(const AbsTime& time, Rounding rounding, std::int64_t& ticks) noexcept
{
    return AbsTimeToCount(time, kFileTimeEpochOffset, TimeUnit::HundredNanoseconds, rounding, ticks);
}

std::int32_t AbsTimeToUnixSeconds(const AbsTime& time, Rounding rounding, std::int64_t& seconds) noexcept
{
    return AbsTimeToCount(time, -kUnixEpochOffset, TimeUnit::Seconds, rounding, seconds);
}

AbsTime AbsTimeFromUnixSeconds(std::int64_t seconds, std::uint64_t fraction)
{
    std::int64_t since1904;
    if (__builtin_add_overflow(seconds, kUnixEpochOffset, &since1904))
        QV_THROW(exception::OutOfRange());
    return {fraction, since1904};
}

std::uint64_t FractionOfSecond(std::uint64_t part, std::uint64_t whole)
{
    if (part >= whole)
        QV_THROW(exception::InvalidArgument());
    const UInt128 scaled = (UInt128{part} << 64) + whole / 2;
    const UInt128 result = scaled / whole;
    // Rounding up just below a whole second keeps the largest fraction.
    return result >= kOneSecond ? ~std::uint64_t{0} : static_cast<std::uint64_t>(result);
}

} // namespace qv::fen
