#pragma once
/// \file
/// Overflow-checked 32-bit unsigned arithmetic and casts for size computations.

#include "fen/Exception.h"

#include <cstddef>
#include <cstdint>
#include <limits>

namespace qv::fen {

/// A 32-bit unsigned count whose arithmetic throws OutOfRange on overflow.
class SafeInteger {
public:
    constexpr SafeInteger(std::uint32_t value = 0) noexcept : value_(value) {}

    /// Accepts a size_t, throwing OutOfRange when it does not fit 32 bits.
    static SafeInteger FromSize(std::size_t value)
    {
        if (value > std::numeric_limits<std::uint32_t>::max())
            QV_THROW(exception::OutOfRange());
        return SafeInteger(static_cast<std::uint32_t>(value));
    }

    SafeInteger operator+(SafeInteger other) const
    {
        std::uint32_t sum = value_ + other.value_;
        if (sum < value_)
            QV_THROW(exception::OutOfRange());
        return SafeInteger(sum);
    }

    SafeInteger operator*(SafeInteger other) const
    {
        std::uint64_t product = std::uint64_t{value_} * other.value_;
        if (product > std::numeric_limits<std::uint32_t>::max())
            QV_THROW(exception::OutOfRange());
        return SafeInteger(static_cast<std::uint32_t>(product));
    }

    /// Twice the value; used for 16-bit byte counts.
    SafeInteger Doubled() const
    {
        if ((value_ & 0x80000000u) != 0)
            QV_THROW(exception::OutOfRange());
        return SafeInteger(value_ << 1);
    }

    constexpr std::uint32_t Value() const noexcept { return value_; }

private:
    std::uint32_t value_;
};

/// Casts a 32-bit unsigned to signed, throwing OutOfRange from 0x80000000 up.
template <typename To>
To NumericCast(std::uint32_t value);

template <>
inline std::int32_t NumericCast<std::int32_t>(std::uint32_t value)
{
    if (value >= 0x80000000u)
        QV_THROW(exception::OutOfRange());
    return static_cast<std::int32_t>(value);
}

} // namespace qv::fen
