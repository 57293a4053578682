#pragma once
/// \file
/// Type codes of a value (low 16 bits of its type word) and numeric kinds
/// (bits 16-19 of a Numeric value's type word).

#include <cstdint>
#include <string_view>

namespace qv::value {

namespace TypeCode {
inline constexpr std::uint16_t Empty = 0;
inline constexpr std::uint16_t Null = 1;
inline constexpr std::uint16_t Logical = 2;
inline constexpr std::uint16_t Numeric = 3;
inline constexpr std::uint16_t Time = 4;
inline constexpr std::uint16_t CairnetBreak = 8;
inline constexpr std::uint16_t LogicalPulse = 11;
/// A u32 in the first payload word; it has no name.
inline constexpr std::uint16_t Word32 = 13;
inline constexpr std::uint16_t UInt64 = 0x11;
inline constexpr std::uint16_t AnsiString = 0x1005;
inline constexpr std::uint16_t UnicodeString = 0x1006;
inline constexpr std::uint16_t RawBytes = 0x1009;
inline constexpr std::uint16_t Dictionary = 0x100C;
inline constexpr std::uint16_t SSTimeValue = 0x100F;
inline constexpr std::uint16_t SSTimeNumber = 0x1010;
inline constexpr std::uint16_t FBVariant = 0x1012;
inline constexpr std::uint16_t FlexData = 0x1013;
inline constexpr std::uint16_t Vector = 0x3007;
} // namespace TypeCode

/// Set in codes whose first payload word points to a storage object.
inline constexpr std::uint32_t kStorageBit = 0x1000;
/// Set in codes whose storage is a vector.
inline constexpr std::uint32_t kVectorBit = 0x2000;

/// Where a Numeric value came from; the value itself is always a double.
enum class NumericKind : std::uint16_t {
    Float64 = 0,
    Int8 = 1,
    Int16 = 2,
    Int32 = 3,
    UInt8 = 4,
    UInt16 = 5,
    UInt32 = 6,
    Float32 = 7,
    /// An unsigned 32-bit bit field, shown in hexadecimal.
    BitField = 8,
};

/// Resource id of the type name of `code` (low 16 bits of a type word).
std::uint32_t TypeNameId(std::uint32_t code) noexcept;
/// The type name of `code` from the string table ("Numeric", "Undefined", ...).
std::string_view TypeName(std::uint32_t code) noexcept;

} // namespace qv::value
