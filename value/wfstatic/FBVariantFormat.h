#pragma once
/// \file
/// The layout shared by the reader and the writer of foreign variants: the
/// type codes of the descriptor, its fixed words, and big-endian loads and
/// stores of the flattened data.

#include <concepts>
#include <cstddef>
#include <cstdint>

namespace qv::value::wfstatic {

/// Type codes (low byte of an element's type word).
namespace FBCode {
inline constexpr std::uint8_t Void = 0x00;
inline constexpr std::uint8_t Int8 = 0x01;
inline constexpr std::uint8_t Int16 = 0x02;
inline constexpr std::uint8_t Int32 = 0x03;
inline constexpr std::uint8_t UInt8 = 0x05;
inline constexpr std::uint8_t UInt16 = 0x06;
inline constexpr std::uint8_t UInt32 = 0x07;
inline constexpr std::uint8_t Float32 = 0x09;
inline constexpr std::uint8_t Float64 = 0x0A;
inline constexpr std::uint8_t Boolean = 0x21;
inline constexpr std::uint8_t String = 0x30;
inline constexpr std::uint8_t Array = 0x40;
inline constexpr std::uint8_t TimeStamp = 0x54;
} // namespace FBCode

/// Set in a type word when the element's name follows its type-specific words.
inline constexpr std::uint16_t kFBNameFlag = 0x4000;
/// The two words that follow a string's type word and an array's dimension
/// count: a dimension of variable size.
inline constexpr std::uint16_t kFBVariableDimension = 0xFFFF;
/// Arrays nest at most this deep. Both sides enforce it, so whatever is
/// written can be read back, and reading a hostile descriptor cannot exhaust
/// the stack.
inline constexpr unsigned kFBMaxArrayNesting = 64;

/// The unsigned number in the `sizeof(T)` bytes at `bytes`, most significant first.
template <std::unsigned_integral T>
T LoadBigEndian(const std::uint8_t* bytes) noexcept
{
    T value = 0;
    for (std::size_t i = 0; i < sizeof(T); ++i)
        value = static_cast<T>((value << 8) | bytes[i]);
    return value;
}

/// Stores `value` into `sizeof(T)` bytes at `bytes`, most significant first.
template <std::unsigned_integral T>
void StoreBigEndian(std::uint8_t* bytes, T value) noexcept
{
    for (std::size_t i = sizeof(T); i-- > 0;) {
        bytes[i] = static_cast<std::uint8_t>(value & 0xFF);
        value = static_cast<T>(value >> 8);
    }
}

} // namespace qv::value::wfstatic
