#pragma once
/// \file
/// The texts of the watch list's cells, computed from an item's record or
/// from one data change.

#include "fen/AbsTime.h"
#include "value/VarData.h"

#include <array>
#include <cstdint>
#include <string>
#include <string_view>

namespace qv::views {

/// The six columns, in display order.
namespace Column {
inline constexpr int FullName = 0;
inline constexpr int ShortName = 1;
inline constexpr int Value = 2;
inline constexpr int Time = 3;
inline constexpr int Quality = 4;
inline constexpr int Access = 5;
} // namespace Column
inline constexpr int kColumnCount = 6;

/// Width in pixels of each column when shown.
inline constexpr std::array<int, kColumnCount> kDefaultColumnWidths = {175, 175, 100, 125, 75, 100};

/// Shown in the Value column instead of the value while the quality is bad.
inline constexpr std::string_view kMaskText = "XXXXX";

/// Header text of `column` from the string table; empty for another number.
std::string_view ColumnHeader(int column);

/// Offset in `url` of its short name: the part after the last backslash,
/// or the whole URL when it has none.
std::size_t ShortNameStart(std::string_view url) noexcept;
std::string ShortName(std::string_view url);

/// The value rule: "True"/"False" for logicals; numbers (other than bit
/// fields) with `decimalDigits` significant digits as "%.*G" prints them,
/// always with a full stop; raw bytes as the bytes themselves or, with
/// `hexForRawData`, two upper-case hex digits per byte; anything else as the
/// value model's conversion to 8-bit text. Digits above 17 are treated as
/// 17, since a double holds no more. Throws the library exception a
/// conversion throws.
std::string FormatValueText(const value::VarData& value, std::uint32_t decimalDigits, bool hexForRawData);

/// Date and time of `time` in the locale's formats, local time, no fraction;
/// empty for "no time"; "Invalid Timestamp" when the time cannot be shown.
std::string TimeCellText(const fen::AbsTime& time);

/// The quality word's flag names joined by ";", with "; error code: " and
/// the code appended when `errorCode` is negative.
std::string QualityCellText(std::uint64_t quality, std::int32_t errorCode);

/// "Read \ Write", "Read Only", "Write Only" or "No Access", from the read
/// and write bits of `access`.
std::string_view AccessText(std::uint16_t access);

/// Image of a row by its item's type code: 1 numeric, 2 logical, 3 text,
/// 0 anything else.
int RowIcon(std::uint16_t dataType) noexcept;

} // namespace qv::views
